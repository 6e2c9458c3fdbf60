// A ticket in memory and a plain map side by side, through a million random operations of the typed views:
// whatever can be asked of both must be equal.
#include "tests/module/LocalTicketUnderTest.h"

#include "comgui/access/STICKET_MODIFY.h"
#include "comgui/access/STICKET_READ.h"
#include "tests/support/sanitizers.h"
#include <map>
#include <random>
#include <variant>

namespace
{
constexpr int Operations = IsSanitized ? 100'000 : 1'000'000;  // each costs some ten times as much there

using VALUE = std::variant<int, double, void*, std::string>;

PARAM_TYPE TypeOf(VALUE const& value)
{
    constexpr PARAM_TYPE types[] = {PARAM_INT, PARAM_DOUBLE, PARAM_POINTER, PARAM_STRING};
    return types[value.index()];
}

class MODEL
{
public:
    bool Set(std::string const& key, VALUE value, int pos)
    {
        if (pos < -2)
            return false;
        auto& values = m_keys[key];
        if (pos == -1)
            values.clear();
        values.insert_or_assign(pos >= 0 ? pos : Count(key), std::move(value));
        return true;
    }

    bool Delete(std::string const& key, int pos)
    {
        if (pos < -1)
            return false;
        if (pos == -1)
            m_keys[key].clear();
        else
            m_keys[key].erase(pos);
        return true;
    }

    int Count(std::string const& key) const
    {
        auto const values = m_keys.find(key);
        return values == m_keys.end() || values->second.empty() ? 0 : values->second.rbegin()->first + 1;
    }

    VALUE const* At(std::string const& key, int pos) const
    {
        auto const values = m_keys.find(key);
        if (values == m_keys.end())
            return nullptr;
        auto const value = values->second.find(pos == -1 ? 0 : pos);
        return value == values->second.end() ? nullptr : &value->second;
    }

    template <typename T>
    T At(std::string const& key, int pos, T otherwise) const
    {
        VALUE const* const value = At(key, pos);
        T const* const found = value ? std::get_if<T>(value) : nullptr;
        return found ? *found : otherwise;
    }

    int Type(std::string const& key, int pos) const
    {
        if (pos == -1 && Count(key) > 1)
            return PARAM_COUNT;
        VALUE const* const value = At(key, pos);
        return value ? TypeOf(*value) : PARAM_NONE;
    }

    // As a walk tells it.
    std::string Lines() const
    {
        std::string lines;
        for (auto const& [key, values] : m_keys)
            for (auto const& [pos, value] : values)
                lines += Line(key.c_str(), TypeOf(value), pos);
        return lines;
    }

    static std::string Line(char const* key, PARAM_TYPE type, int pos)
    {
        return std::string(key) + " " + std::to_string(type) + " " + std::to_string(pos) + "\n";
    }

private:
    std::map<std::string, std::map<int, VALUE>> m_keys;
};

class LocalTicketModel : public testing::Test
{
protected:
    int Among(int from, int to) { return std::uniform_int_distribution(from, to)(random); }

    // The same random write to both.
    void Write()
    {
        char const* const key = Key();
        int const pos = Among(-3, 7);
        int const number = Among(-1000, 1000);
        std::string const text = std::to_string(number) + " \xC3\xA4 of a length that lies on the heap";
        auto const& ticket = *STICKET_MODIFY::Of(access.Access());
        auto const expect = [&](int result, VALUE value)
        { EXPECT_EQ(result != 0, model.Set(key, std::move(value), pos)) << key << pos; };
        switch (Among(0, 6))
        {
        case 0:
            return expect(ticket.SetParameter(key, number, pos), number);
        case 1:
            return expect(ticket.SetParameter(key, number / 8.0, pos), number / 8.0);
        case 2:
            return expect(ticket.SetParameter(key, number > 0, pos), number > 0 ? 1 : 0);
        case 3:
            return expect(ticket.SetParameter(key, &random + number, pos), &random + number);
        case 4:
            return expect(ticket.SetParameter(key, wxString::FromUTF8(text), pos), text);
        default:  // twice as often, or the keys would hardly ever be empty
            EXPECT_EQ(ticket.DelParameter(key, pos) != 0, model.Delete(key, pos)) << key << pos;
        }
    }

    // The same random read from both.
    void Read()
    {
        char const* const key = Key();
        int const pos = Among(-1, 8);
        auto const& ticket = *STICKET_READ::Of(access.Access());
        std::string const none = "none";
        switch (Among(0, 6))
        {
        case 0:
            EXPECT_EQ(ticket.GetIntParameter(pos, key, 5000), model.At(key, pos, 5000));
            break;
        case 1:
            EXPECT_EQ(ticket.GetDoubleParameter(pos, key, 0.3), model.At(key, pos, 0.3));
            break;
        case 2:
            EXPECT_EQ(ticket.GetVoidParameter(pos, key, this), model.At<void*>(key, pos, this));
            break;
        case 3:
            EXPECT_EQ(ticket.GetStringParameter(key, none), model.At(key, -1, none));
            break;
        case 4:
            EXPECT_EQ(ticket.GetWxStringParameter(pos, key, "none").utf8_string(), model.At(key, pos, none));
            break;
        case 5:
            EXPECT_EQ(ticket.ParameterType(key, pos), model.Type(key, pos));
            break;
        default:
            EXPECT_EQ(ticket.GetVectorSize(key), static_cast<unsigned long>(model.Count(key)));
        }
    }

    std::string WalkedLines() const
    {
        std::string lines;
        auto const take = [](void* context, char const* key, PARAM_TYPE type, void const*, int pos)
        {
            *static_cast<std::string*>(context) += MODEL::Line(key, type, pos);
            return true;
        };
        EXPECT_EQ(access->SWALKPARAMETERS(access.Instance(), take, &lines, "", 8000), 1);
        return lines;
    }

    char const* Key()
    {
        static constexpr char const* Keys[] = {
            "A", "B", "a", "Job/Name", "Job", "\xC3\x84", "a rather long key that lies on the heap"};
        return Keys[Among(0, 6)];
    }

    std::mt19937 random{20240229};
    TICKET_FACTORY factory;
    TICKET access{factory, nullptr};
    MODEL model;
};
}  // namespace

TEST_F(LocalTicketModel, RandomOperations_EqualAPlainMap)
{
    for (int i = 0; i < Operations && !HasFailure(); ++i)
    {
        if (Among(0, 1) == 0)
            Write();
        else
            Read();
        if (i % 1000 == 0)
        {
            EXPECT_EQ(WalkedLines(), model.Lines()) << i;
        }
    }
    EXPECT_EQ(WalkedLines(), model.Lines());
}
