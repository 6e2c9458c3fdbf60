// Lists written in one way, chosen by lot, and read back in every way there is, against a plain model: which
// values stand at which positions.
#include "tests/access/ListFamilies.h"
#include <gmock/gmock.h>
#include <map>
#include <random>

namespace
{
constexpr int Rounds = 300;

// The values of a key as a ticket should hold them.
template <typename T>
class MODEL
{
public:
    void Assign(std::vector<T> const& values)
    {
        m_values.clear();
        for (T const& value : values)
            m_values.emplace(static_cast<int>(m_values.size()), value);
    }
    void Erase(int pos) { m_values.erase(pos); }

    // One more than the last position.
    std::size_t Count() const
    {
        return m_values.empty() ? 0 : static_cast<std::size_t>(m_values.rbegin()->first) + 1;
    }
    T const* At(std::size_t pos) const
    {
        auto const found = m_values.find(static_cast<int>(pos));
        return found == m_values.end() ? nullptr : &found->second;
    }
    // What is there, without the gaps.
    std::vector<T> Closed() const
    {
        std::vector<T> values;
        for (auto const& [pos, value] : m_values)
            values.push_back(value);
        return values;
    }

private:
    std::map<int, T> m_values;
};

template <typename Family>
class RoundTrip : public ListsInBothFamilies<Family>
{
protected:
    std::mt19937 random{20261121};

    std::size_t Below(std::size_t limit)
    {
        return std::uniform_int_distribution<std::size_t>(0, limit - 1)(random);
    }

    template <typename T>
    std::vector<T> Any(std::vector<T> const& choice)
    {
        std::vector<T> values(Below(7));
        for (T& value : values)
            value = choice[Below(choice.size())];
        return values;
    }

    // Now and then a value is deleted by itself, and leaves a gap.
    template <typename T>
    void MaybeMakeAGap(MODEL<T>& model)
    {
        if (model.Count() < 2 || Below(3) != 0)
            return;
        int const pos = static_cast<int>(Below(model.Count()));
        this->ticket.DelParameter("k", pos);
        model.Erase(pos);
    }

    template <typename T, typename Read>
    void CheckVector(MODEL<T> const& model, Read read)
    {
        std::vector<T> const old(3);
        std::vector<T> out = old;
        EXPECT_EQ(read(out), model.Count() != 0);
        EXPECT_EQ(out, model.Count() == 0 ? old : model.Closed());
    }

    // Arrays from none to one more than the list.
    template <typename T, typename Read>
    void CheckArray(MODEL<T> const& model, T filler, Read read)
    {
        for (std::size_t size = 0; size <= model.Count() + 1; ++size)
        {
            std::vector<T> out(size + 1, filler);
            bool isWhole = size != 0;
            std::vector<T> expected = out;
            for (std::size_t pos = 0; pos < size; ++pos)
                if (T const* const value = model.At(pos))
                    expected[pos] = *value;
                else
                    isWhole = false;
            EXPECT_EQ(read(out.data(), size), isWhole);
            EXPECT_EQ(out, expected);
        }
    }

    template <typename T>
    void CheckByEveryForm(MODEL<T> const& model)
    {
        T const filler = SomeValues<T>()[1];
        CheckVector(model, [this](auto& out) { return this->ticket.GetVector(out); });
        CheckVector(model, [this](auto& out) { return this->ticket.xGetVector(out); });
        CheckArray(model, filler, [this](T* out, std::size_t n) { return this->ticket.GetArray(out, n); });
        CheckArray(model, filler, [this](T* out, std::size_t n) { return this->ticket.xGetArray(out, n); });
    }

    void CheckAsBools(MODEL<int> const& model)
    {
        std::vector<int> const closed = model.Closed();
        std::vector<bool> bools;
        EXPECT_EQ(this->ticket.GetVector(bools), !closed.empty());
        ASSERT_EQ(bools.size(), closed.size());
        bool array[8] = {};
        bool const isWhole = model.Count() != 0 && closed.size() == model.Count();
        EXPECT_EQ(this->ticket.GetArray(array, model.Count()), isWhole);
        for (std::size_t i = 0; i < closed.size(); ++i)
        {
            EXPECT_EQ(bools[i], closed[i] != 0);
            EXPECT_EQ(array[i], isWhole && closed[i] != 0);
        }
    }

    void CheckAsWxArray(MODEL<int> const& model)
    {
        wxArrayInt array;
        EXPECT_EQ(this->ticket.GetWxArray(array), model.Count() != 0);
        EXPECT_EQ(std::vector<int>(array.begin(), array.end()), model.Closed());
    }

    // A list of longs as long as the key is, whose values fall back on their defaults in the gaps.
    void CheckAsVariants(MODEL<int> const& model)
    {
        wxVariant def;
        def.NullList();
        def.SetName("k");
        for (std::size_t i = 0; i <= model.Count(); ++i)
            def.Append(wxVariant(-99L));
        wxVariant const value = this->ticket.GetVariantDef(def, -1);
        ASSERT_EQ(value.GetCount(), model.Count() + 1);
        for (std::size_t i = 0; i <= model.Count(); ++i)
            EXPECT_EQ(value[i].GetLong(), model.At(i) ? *model.At(i) : -99);

        wxVariant stored;
        EXPECT_EQ(this->ticket.GetVariantChk(stored, -1), model.Count() != 0);
        if (model.Count() > 1 && model.At(0))
        {
            std::size_t whole = 0;
            while (model.At(whole))
                ++whole;
            ASSERT_EQ(stored.GetCount(), whole);
            for (std::size_t i = 0; i < whole; ++i)
                EXPECT_EQ(stored[i].GetLong(), *model.At(i));
        }
    }

    // Writes numbers or pointers in one of four ways.
    template <typename T>
    bool Write(std::size_t form, std::vector<T> const& in)
    {
        switch (form)
        {
        case 0:
            return this->ticket.SetVector(in);
        case 1:
            return this->ticket.SetArray(in.data(), in.size());
        case 2:
            return this->ticket.xSetVector(in);
        default:
            return this->ticket.xSetArray(in.data(), in.size());
        }
    }

    template <typename T>
    void Run()
    {
        MODEL<T> model;
        for (int round = 0; round < Rounds && !testing::Test::HasFailure(); ++round)
        {
            std::vector<T> const in = Any(SomeValues<T>());
            EXPECT_TRUE(Write(Below(4), in));
            model.Assign(in);
            MaybeMakeAGap(model);
            CheckByEveryForm(model);
        }
    }

    // The ints of one of the ways that only ints have; gives what should be stored.
    std::vector<int> WriteInts(std::vector<int> const& in)
    {
        std::vector<bool> bools;
        wxArrayInt array;
        for (int const value : in)
        {
            bools.push_back(value != 0);
            array.Add(value);
        }
        bool const someBools[8] = {true, true};
        switch (Below(4))
        {
        case 0:
            EXPECT_TRUE(this->ticket.SetVector(bools));
            return std::vector<int>(bools.begin(), bools.end());
        case 1:
            EXPECT_TRUE(this->ticket.SetWxArray(array));
            return in;
        case 2:
            EXPECT_TRUE(this->ticket.SetArray(someBools, in.size() + 1));
            return {};
        default:
            EXPECT_TRUE(Write(Below(4), in));
            return in;
        }
    }

    // The texts of one of all ways; gives what should be stored, after what was.
    std::vector<wxString> WriteTexts(std::vector<wxString> const& in, std::vector<wxString> const& before)
    {
        wxArrayString array;
        std::vector<char const*> narrow;
        wxVariant list;
        list.NullList();
        for (wxString const& text : in)
        {
            array.Add(text);
            narrow.push_back(text.utf8_str());
            list.Append(wxVariant(text));
        }
        std::vector<wxString> behindEmptyOnes;
        if (std::is_same_v<Family, CONTAINED>)
            behindEmptyOnes.resize(in.size());
        behindEmptyOnes.insert(behindEmptyOnes.end(), in.begin(), in.end());
        switch (Below(5))
        {
        case 0:
            EXPECT_TRUE(this->ticket.SetVector(in));
            return in;
        case 1:
            EXPECT_TRUE(this->ticket.xSetVector(narrow));
            return in;
        case 2:
            EXPECT_TRUE(this->ticket.SetWxArray(array));
            return behindEmptyOnes;
        case 3:
            EXPECT_TRUE(this->ticket.SetVariant(wxVariant(array), -1));
            return behindEmptyOnes;
        default:
            EXPECT_TRUE(this->ticket.SetVariant(list, -1));
            return in.empty() ? before : in;
        }
    }

    void CheckTexts(MODEL<wxString> const& model)
    {
        std::vector<wxString> const closed = model.Closed();
        CheckVector(model, [this](auto& out) { return this->ticket.GetVector(out); });

        wxArrayString array;
        array.Add("old");
        EXPECT_EQ(this->ticket.GetWxArray(array), !closed.empty());
        std::vector<wxString> expected = closed;
        expected.insert(expected.begin(), "old");
        EXPECT_THAT(array, testing::ElementsAreArray(expected));

        std::vector<char const*> narrow;
        EXPECT_EQ(this->ticket.xGetVector(narrow), !closed.empty());
        ASSERT_EQ(narrow.size(), closed.size());
        for (std::size_t i = 0; i < closed.size(); ++i)
            EXPECT_STREQ(narrow[i], closed[i].utf8_str());
    }

    void CheckTextsAsVariants(MODEL<wxString> const& model)
    {
        wxVariant stored;
        EXPECT_EQ(this->ticket.GetVariantChk(stored, -1), model.Count() != 0);
        if (model.Count() == 1)
        {
            EXPECT_EQ(stored.GetString(), *model.At(0));
        }
        if (model.Count() > 1)
        {
            EXPECT_THAT(stored.GetArrayString(), testing::ElementsAreArray(model.Closed()));
        }

        wxArrayString defaults;
        defaults.Add("default", model.Count() + 1);
        wxVariant const like = this->ticket.GetVariantDef(wxVariant(defaults, "k"), -1);
        for (std::size_t i = 0; i <= model.Count(); ++i)
            EXPECT_EQ(like.GetArrayString()[i], model.At(i) ? *model.At(i) : wxString("default"));
    }
};
}  // namespace

TYPED_TEST_SUITE(RoundTrip, Families);

TYPED_TEST(RoundTrip, Pointers) { this->template Run<void*>(); }
TYPED_TEST(RoundTrip, Unsigned) { this->template Run<unsigned int>(); }
TYPED_TEST(RoundTrip, Int64) { this->template Run<long long>(); }
TYPED_TEST(RoundTrip, Unsigned64) { this->template Run<unsigned long long>(); }
TYPED_TEST(RoundTrip, Doubles) { this->template Run<double>(); }

TYPED_TEST(RoundTrip, Ints)
{
    MODEL<int> model;
    for (int round = 0; round < Rounds && !testing::Test::HasFailure(); ++round)
    {
        model.Assign(this->WriteInts(this->Any(SomeValues<int>())));
        this->MaybeMakeAGap(model);
        this->CheckByEveryForm(model);
        this->CheckAsBools(model);
        this->CheckAsWxArray(model);
        this->CheckAsVariants(model);
    }
}

TYPED_TEST(RoundTrip, Texts)
{
    std::vector<wxString> const choice = {"", "a", wxString::FromUTF8("Gr\xC3\xBCn"), "$(A)/x",
                                          wxString('x', 400)};
    MODEL<wxString> model;
    std::vector<wxString> stored;
    for (int round = 0; round < Rounds && !testing::Test::HasFailure(); ++round)
    {
        stored = this->WriteTexts(this->Any(choice), stored);
        model.Assign(stored);
        this->CheckTexts(model);
        this->CheckTextsAsVariants(model);
        MODEL<wxString> withGap = model;
        this->MaybeMakeAGap(withGap);
        this->CheckTexts(withGap);
        this->CheckTextsAsVariants(withGap);
        this->ticket.SetVector(stored);
    }
}
