// How long what the module hands out lives: it is looked at in the last moment that is promised, and its
// memory is counted at the first that is not. Memory that was given back has other bytes in this program.
#include "comgui/ticket/TICKET_OP.h"
#include "tests/module/LocalTicketUnderTest.h"
#include "tests/support/Allocations.h"
#include <vector>

namespace
{
constexpr int Type = 3;
constexpr int Texts = 2000;
constexpr long Others = 400;  // that the site's own threads may have or have not, at most

// A client that reads texts of one ticket.
class READER
{
public:
    explicit READER(MODULE_AT_SITE const& site)
        : m_site(site), m_session(site.LogIn()), m_container(site.Container(m_session))
    {
    }

    static std::string Content(int pos) { return "a text that lies on the heap, " + std::to_string(pos); }

    void Write() const
    {
        for (int pos = 0; pos < Texts; ++pos)
            Set("Texts", PARAM_STRING, Content(pos).c_str(), pos);
    }
    void Delete() const { Set("Texts", PARAM_NONE, nullptr, -1); }
    void Set(char const* key, PARAM_TYPE type, void const* value, int pos) const
    {
        ASSERT_TRUE(m_container->MSETPARAMETER(m_container->Instance, Type, 1, key, type, value, pos));
    }

    std::vector<char const*> Read() const
    {
        std::vector<char const*> texts(Texts, "");
        for (int pos = 0; pos < Texts; ++pos)
            EXPECT_TRUE(m_container->MGETPARAMETER(m_container->Instance, Type, 1, "Texts", PARAM_STRING,
                                                   &texts[static_cast<std::size_t>(pos)], pos));
        return texts;
    }
    void Walk(SWALKPARAMETERS_ACTION action, void* context) const
    {
        STICKET_ACCESS const* ticket = nullptr;
        ASSERT_TRUE(m_container->MOPERATION(m_container->Instance, Type, 1, MTICKET_OP_OPEN, &ticket));
        EXPECT_EQ(ticket->SWALKPARAMETERS(ticket->Instance, action, context, "Texts", 8000), 1);
    }
    void Logout() const { EXPECT_EQ(m_site.module->LogoutEntry(m_site.module.Instance(), m_session), 0); }

    static void ExpectWhole(std::vector<char const*> const& texts)
    {
        for (int pos = 0; pos < Texts; ++pos)
            ASSERT_EQ(texts[static_cast<std::size_t>(pos)], Content(pos));
    }

private:
    MODULE_AT_SITE const& m_site;
    void* m_session;
    MTICKET_ACCESS const* m_container;
};

// What is retired goes when enough is waiting.
void Flush(READER const& reader)
{
    for (int i = 0; i < 200; ++i)
        reader.Set("Other", PARAM_INT, &i, -1);
}

class Lifetimes : public ModuleTest
{
protected:
    // Blocks that are there once the work is done, beside those before it.
    template <typename Work>
    static long Grown(Work const& work)
    {
        long const before = LiveAllocations();
        work();
        return LiveAllocations() - before;
    }

    READER const first{*this};
    READER const second{*this};
};
}  // namespace

TEST_F(Lifetimes, TextsThatNobodyHasRead_GoWithTheirValues)
{
    Flush(first);
    long const grown = Grown(
        [&]
        {
            first.Write();
            first.Delete();
            Flush(first);
        });
    EXPECT_LT(grown, Others);
}

TEST_F(Lifetimes, TextsThatWereRead_StayUntilTheLogout)
{
    Flush(second);
    long const before = LiveAllocations();
    first.Write();
    auto const texts = first.Read();
    first.Delete();
    Flush(second);
    EXPECT_GT(LiveAllocations() - before, Texts - Others);
    READER::ExpectWhole(texts);
    first.Logout();
    EXPECT_LT(LiveAllocations() - before, Others);
}

TEST_F(Lifetimes, TextsThatTwoHaveRead_StayUntilTheLastHasLoggedOut)
{
    for (bool const isNewestLast : {true, false})
    {
        READER const one(*this);
        READER const other(*this);
        READER const& last = isNewestLast ? other : one;
        Flush(first);
        long const before = LiveAllocations();
        first.Write();
        auto const texts = one.Read();
        EXPECT_EQ(other.Read(), texts);
        first.Delete();
        Flush(first);
        (isNewestLast ? one : other).Logout();
        EXPECT_GT(LiveAllocations() - before, Texts - Others);
        READER::ExpectWhole(texts);
        last.Logout();
        EXPECT_LT(LiveAllocations() - before, Others);
    }
}

// The action ends the session whose walk it is, and another deletes the values.
TEST_F(Lifetimes, TextsOfAWalk_StayToItsEnd)
{
    struct WALK
    {
        READER const& walker;
        READER const& writer;
        int calls = 0;
    } walk{first, second};
    Flush(second);
    long const before = LiveAllocations();
    second.Write();
    auto const action = [](void* context, char const* key, PARAM_TYPE, void const* value, int pos)
    {
        auto& now = *static_cast<WALK*>(context);
        ++now.calls;
        now.walker.Logout();
        now.writer.Delete();
        Flush(now.writer);
        EXPECT_EQ(static_cast<char const*>(value), READER::Content(pos));
        EXPECT_STREQ(key, "Texts");
        return true;
    };
    first.Walk(action, &walk);
    EXPECT_EQ(walk.calls, 1);
    Flush(second);
    EXPECT_LT(LiveAllocations() - before, Others);
}

// Whatever ticket they were of, and whether it is still open.
TEST_F(Lifetimes, NumbersOfWalks_StayUntilTheLogout)
{
    Flush(second);
    long const before = LiveAllocations();
    for (int pos = 0; pos < Texts; ++pos)
        second.Set("Texts", PARAM_INT, &pos, pos);
    std::vector<void const*> numbers;
    auto const action = [](void* context, char const*, PARAM_TYPE, void const* value, int)
    {
        static_cast<std::vector<void const*>*>(context)->push_back(value);
        return true;
    };
    first.Walk(action, &numbers);
    second.Delete();
    Flush(second);
    ASSERT_EQ(numbers.size(), std::size_t{Texts});
    for (int pos = 0; pos < Texts; ++pos)
        ASSERT_EQ(*static_cast<int const*>(numbers[static_cast<std::size_t>(pos)]), pos);
    EXPECT_GT(LiveAllocations() - before, Texts - Others);
    first.Logout();
    EXPECT_LT(LiveAllocations() - before, Others);
}

TEST(LocalTicketLifetimes, TextsThatWereRead_StayUntilTheTicketIsDestroyed)
{
    TICKET_FACTORY const factory;
    static_cast<void>(TICKET(factory, nullptr));
    long const before = LiveAllocations();
    {
        TICKET const ticket(factory, nullptr);
        ticket.Set("A", "a text that lies on the heap, as it is long");
        char const* text = nullptr;
        ASSERT_EQ(ticket.Get("A", PARAM_STRING, &text), 1);
        ticket.Set("A", 1);
        ticket.Delete("A");
        EXPECT_STREQ(text, "a text that lies on the heap, as it is long");
    }
    EXPECT_EQ(LiveAllocations(), before);
}

// The keys of its beginning, although the action deletes them and writes so many others that unused keys go.
TEST(LocalTicketLifetimes, KeysOfAWalk_StayToItsEnd)
{
    TICKET_FACTORY const factory;
    TICKET const ticket(factory, nullptr);
    for (char const* const key : {"a key of a walk", "one more key of a walk"})
        ticket.Set(key, 1);
    auto const action = [](void* context, char const* key, PARAM_TYPE, void const*, int)
    {
        auto const& walked = *static_cast<TICKET const*>(context);
        walked.Delete("a key of a walk");
        walked.Delete("one more key of a walk");
        for (int i = 0; i < 3000; ++i)
        {
            std::string const other = "other " + std::to_string(i);
            walked.Set(other.c_str(), i);
            walked.Delete(other.c_str());
        }
        EXPECT_STREQ(key, "a key of a walk");
        return true;
    };
    EXPECT_EQ(ticket->SWALKPARAMETERS(ticket.Instance(), action, const_cast<TICKET*>(&ticket), "", 8000), 1);
}
