// What a host's process leaves behind that is killed at any instant. Each test is a process of its own: once
// it has a site open it cannot bring up another child that may.
#include "tests/integration/Host.h"
#include "tests/support/ChildProcess.h"
#include <random>
#include <thread>

namespace
{
using KilledWriter = Host;

// Two values of one round, and enough beside them that the kill may come in the middle of the writing.
void SaveRound(wxString const& file, int round)
{
    STICKET_ACCESS const* ticket = CreateTicket(file.utf8_str());
    if (!ticket)
        _exit(1);
    SETMULTIPAR table[] = {
        {"Test/A", PARAM_INT, 0, &round, -1, false, {}}, {"Test/Z", PARAM_INT, 0, &round, -1, false, {}}, {}};
    ticket->SSETMULTIPAR(ticket->Instance, table);
    DestroyTicket(ticket);
}
}  // namespace

TEST_F(KilledWriter, AcknowledgedWrite_IsThere)
{
    std::int64_t acknowledged = 0;
    {
        ChildProcess child(
            [](auto const& tell)
            {
                if (LogIn() == 0)
                    for (int i = 1; WriteInt("Test/Counter", i) == 1; ++i)
                        tell(i);
            });
        while (acknowledged < 200)
        {
            std::optional<std::int64_t> const number = child.Next();
            ASSERT_TRUE(number);
            acknowledged = *number;
        }
        child.Kill();
        acknowledged = child.Last(acknowledged);
    }
    ASSERT_EQ(LogIn(), 0);
    EXPECT_GE(ReadInt("Test/Counter"), acknowledged);
    EXPECT_LE(ReadInt("Test/Counter"), acknowledged + 1);  // one more may have been on its way
}

TEST_F(KilledWriter, Table_IsThereWholeOrNotAtAll)
{
    constexpr int Size = 500;
    ChildProcess child(
        [](auto const& tell)
        {
            if (LogIn() != 0)
                return;
            MTICKET_ACCESS const* const container = Manager().GetClientContainer();
            std::vector<std::string> keys;
            for (int i = 0; i < Size; ++i)
                keys.push_back("Test/Table/" + std::to_string(i));
            std::vector<SETMULTIPAR> table(Size + 1);
            for (int round = 1;; ++round)
            {
                for (std::size_t i = 0; i < Size; ++i)
                    table[i] = {keys[i].c_str(), PARAM_INT, 0, &round, -1, false, {}};
                if (container->MSETMULTIPAR(container->Instance, 3, 1, table.data()) == 0)
                    return;
                tell(round);
            }
        });
    for (int i = 0; i < 5; ++i)
        ASSERT_TRUE(child.Next());
    child.Kill();

    ASSERT_EQ(LogIn(), 0);
    int const round = ReadInt("Test/Table/0");
    EXPECT_GE(round, 5);
    for (int i = 1; i < Size; ++i)
        ASSERT_EQ(ReadInt(("Test/Table/" + std::to_string(i)).c_str()), round);
}

TEST_F(KilledWriter, TicketFile_IsWholeAndOldOrNew)
{
    std::string const filler(20'000, 'x');
    folder.Write("ticket.xml", "<ticket version='1'><parameter key='Test/Filler' type='string'>" + filler +
                                   "</parameter></ticket>");
    wxString const file = wxString::FromUTF8((folder.Path() / "ticket.xml").string());
    std::mt19937 random(815);
    int before = 0;
    for (int kill = 0; kill < 200; ++kill)
    {
        std::int64_t acknowledged = before;
        {
            ChildProcess child(
                [&](auto const& tell)
                {
                    Manager();  // brings the plug-in, and with it the factory
                    for (int round = before + 1;; ++round)
                    {
                        SaveRound(file, round);
                        tell(round);
                    }
                });
            ASSERT_TRUE(child.Next());  // it has got going
            ++acknowledged;
            std::this_thread::sleep_for(
                std::chrono::microseconds(std::uniform_int_distribution(0, 5000)(random)));
            child.Kill();
            acknowledged = child.Last(acknowledged);
        }
        int const round = Manager().GetIntParameterFromLocal(file, "Test/A", -2, -1);
        ASSERT_TRUE(round == acknowledged || round == acknowledged + 1) << round << " " << acknowledged;
        ASSERT_EQ(Manager().GetIntParameterFromLocal(file, "Test/Z", -2, -1), round);
        ASSERT_EQ(Manager().GetStringParameterFromLocal(file, "Test/Filler", -1).size(), filler.size());
        before = round;
    }
}
