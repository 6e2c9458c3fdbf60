// Tickets as a whole: opened and closed, created, limited to some keys, walked over.
#include "tests/module/NotificationListener.h"

#include <gmock/gmock.h>
#include <iterator>
#include <thread>

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
int ReadInt(STICKET_ACCESS const* ticket, char const* key, int pos = -1)
{
    int value = -1;
    ticket->SGETPARAMETER(ticket->Instance, key, PARAM_INT, &value, pos);
    return value;
}

int WriteInt(STICKET_ACCESS const* ticket, char const* key, int value, int pos = -1)
{
    return ticket->SSETPARAMETER(ticket->Instance, key, PARAM_INT, &value, pos);
}

// Walks over a ticket and gives "key@pos" of each value; nothing if the walk was refused.
std::optional<std::vector<std::string>> Walked(STICKET_ACCESS const* ticket)
{
    std::vector<std::string> walked;
    auto const action = [](void* context, char const* key, PARAM_TYPE, void const*, int pos)
    {
        static_cast<std::vector<std::string>*>(context)->push_back(std::string(key) + "@" +
                                                                   std::to_string(pos));
        return true;
    };
    if (!ticket->SWALKPARAMETERS(ticket->Instance, action, &walked, "", 8000))
        return std::nullopt;
    return walked;
}

// Runs a function for every ticket of a walk.
using VISIT = std::function<bool(int type, int id, STICKET_ACCESS const* ticket)>;

int WalkTickets(CLIENT const& client, int type, VISIT visit)
{
    auto const action = [](void* context, int ticketType, int id, STICKET_ACCESS const* ticket)
    { return (*static_cast<VISIT*>(context))(ticketType, id, ticket); };
    return client.Access()->MWALKTICKETS(client.Access()->Instance, action, &visit, type);
}

std::vector<int> Ids(CLIENT const& client, int type)
{
    std::vector<int> ids;
    EXPECT_EQ(WalkTickets(client, type,
                          [&](int, int id, STICKET_ACCESS const*)
                          {
                              ids.push_back(id);
                              return true;
                          }),
              1);
    return ids;
}

constexpr int Type = 50;  // a new site has no ticket of it
}  // namespace

using OpenTickets = ClientTest;
using CreatedTickets = ClientTest;
using PartialTickets = ClientTest;
using TicketWalks = ClientTest;
using ParameterWalks = ClientTest;

TEST_F(OpenTickets, ReadAndWriteTheTicketOfTheContainer)
{
    auto const* const ticket = other.Open(3, 1);
    ASSERT_TRUE(ticket);
    EXPECT_TRUE(WriteInt(ticket, "Test/K", 7));
    EXPECT_EQ(admin.Read(3, 1, "Test/K"), 7);
    EXPECT_TRUE(admin.Write(3, 1, "Test/K", 8));
    EXPECT_EQ(ReadInt(ticket, "Test/K"), 8);
    int value = 9;
    int read = 0;
    SETMULTIPAR writes[] = {{"Test/K", PARAM_INT, 0, &value, -2, false, {}}, {}};
    GETMULTIPAR reads[] = {{"Test/K", PARAM_INT, 0, &read, 1, false, {}}, {}};
    EXPECT_EQ(ticket->SSETMULTIPAR(ticket->Instance, writes), 1);
    EXPECT_TRUE(writes[0].ok);
    EXPECT_EQ(ticket->SGETMULTIPAR(ticket->Instance, reads), 1);
    EXPECT_TRUE(reads[0].ok);
    EXPECT_EQ(read, 9);
}

// Records may name keys in any order, at one address or at many.
TEST_F(OpenTickets, ReadATableWhoseRecordsNameKeysInTurn)
{
    auto const* const ticket = other.Open(3, 1);
    ASSERT_TRUE(ticket);
    ASSERT_TRUE(WriteInt(ticket, "Test/A", 1));
    ASSERT_TRUE(WriteInt(ticket, "Test/B", 2));
    std::string const sameText = "Test/A";
    char const* const keys[] = {"Test/A", "Test/B", "Test/A", sameText.c_str(), "Test/None", "Test/B"};
    int values[std::size(keys)] = {};
    std::vector<GETMULTIPAR> reads;
    for (std::size_t i = 0; i < std::size(keys); ++i)
        reads.push_back({keys[i], PARAM_INT, 0, &values[i], -1, false, {}});
    reads.push_back({});
    EXPECT_EQ(ticket->SGETMULTIPAR(ticket->Instance, reads.data()), 1);
    EXPECT_THAT(values, ElementsAre(1, 2, 1, 1, 0, 2));
    EXPECT_FALSE(reads[4].ok);
}

TEST_F(OpenTickets, OfOneSession_HaveOneTableEach)
{
    auto const* const ticket = admin.Open(3, 1);
    EXPECT_EQ(admin.Open(3, 1), ticket);
    EXPECT_NE(admin.Open(0, 0), ticket);
    EXPECT_NE(other.Open(3, 1), ticket);
}

TEST_F(OpenTickets, AreCountedAndAnswer0AfterTheLastClose)
{
    auto const* const ticket = admin.Open(3, 1);
    admin.Open(3, 1);
    ASSERT_TRUE(WriteInt(ticket, "Test/K", 7));
    EXPECT_EQ(admin.Close(3, 1), 1);
    EXPECT_EQ(ReadInt(ticket, "Test/K"), 7);
    EXPECT_EQ(admin.Close(3, 1), 1);
    EXPECT_EQ(ReadInt(ticket, "Test/K"), -1);
    EXPECT_EQ(WriteInt(ticket, "Test/K", 8), 0);
    EXPECT_FALSE(Walked(ticket));
    STICKET_OPTION_WHOAMI who{1, 2};
    EXPECT_EQ(ticket->SOPTION(ticket->Instance, STICKET_OP_WHOAMI, &who), 0);
    EXPECT_EQ(who.word8, 2u);
    EXPECT_EQ(admin.Read(3, 1, "Test/K"), 7);
    EXPECT_EQ(admin.Close(3, 1), 0);
}

TEST_F(OpenTickets, OpenedAgain_HaveTheTableOfBefore)
{
    auto const* const ticket = admin.Open(3, 1);
    admin.Close(3, 1);
    EXPECT_EQ(admin.Open(3, 1), ticket);
    EXPECT_TRUE(WriteInt(ticket, "Test/K", 7));
}

TEST_F(OpenTickets, TheFlagOfAClose_IsNotLookedAt)
{
    bool flag = true;
    ASSERT_TRUE(admin.Open(3, 1) && admin.Open(3, 1));
    EXPECT_EQ(admin.Operate(3, 1, MTICKET_OP_CLOSE, &flag), 1);
    EXPECT_EQ(admin.Operate(3, 1, MTICKET_OP_CLOSE, nullptr), 1);
    EXPECT_TRUE(flag);
}

TEST_F(OpenTickets, WhatCannotBeOpened_IsRefused)
{
    for (auto const& [type, id] : {std::pair{3, 999}, {-1, 1}, {100, 1}, {3, -1}, {3, -3}, {3, 0x1000000}})
    {
        STICKET_ACCESS const* ticket = admin.Open(3, 1);
        auto const* const before = ticket;
        EXPECT_EQ(admin.Operate(type, id, MTICKET_OP_OPEN, &ticket), 0) << type << '/' << id;
        EXPECT_EQ(ticket, before);
        EXPECT_EQ(admin.Close(type, id), 0);
    }
    EXPECT_EQ(admin.Operate(3, 1, MTICKET_OP_OPEN, nullptr), 0);
    EXPECT_EQ(admin.Close(0, 0), 0);  // exists, but was not opened
}

TEST_F(OpenTickets, Deleted_Answer0AlsoWhenAnotherHasTheirAddress)
{
    auto const* const ticket = admin.Open(3, 1);
    ASSERT_TRUE(ticket);
    EXPECT_EQ(other.Operate(3, 1, MTICKET_OP_DELETE), 1);
    EXPECT_EQ(WriteInt(ticket, "Test/K", 8), 0);
    EXPECT_FALSE(Walked(ticket));
    ASSERT_TRUE(other.Create(3, 1));
    other.Write(3, 1, "Test/K", 9);
    EXPECT_EQ(ReadInt(ticket, "Test/K"), -1);
    EXPECT_EQ(WriteInt(ticket, "Test/K", 8), 0);
    EXPECT_FALSE(Walked(ticket));
    auto const* const anew = admin.Open(3, 1);
    ASSERT_TRUE(anew);
    EXPECT_NE(anew, ticket);
    EXPECT_EQ(ReadInt(anew, "Test/K"), 9);
    EXPECT_EQ(ReadInt(ticket, "Test/K"), -1);
}

TEST_F(OpenTickets, AfterLogout_Answer0)
{
    auto const* const ticket = admin.Open(3, 1);
    ASSERT_TRUE(WriteInt(ticket, "Test/K", 7));
    admin.Logout();
    EXPECT_EQ(ReadInt(ticket, "Test/K"), -1);
    EXPECT_EQ(WriteInt(ticket, "Test/K", 8), 0);
    EXPECT_FALSE(Walked(ticket));
    EXPECT_EQ(admin.Open(3, 1), nullptr);
    EXPECT_EQ(admin.Close(3, 1), 0);
    EXPECT_EQ(admin.CreateNext(3), -1);
    EXPECT_EQ(admin.Create(3, 77), nullptr);
    EXPECT_EQ(admin.Limit(3, 1, {"K"}), 0);
    EXPECT_EQ(WalkTickets(admin, 3, [](int, int, auto) { return true; }), 0);
    EXPECT_EQ(other.Read(3, 1, "Test/K"), 7);
}

TEST_F(OpenTickets, KeepTheRightsOfTheirUser)
{
    auto const* const system = other.Open(0, 0);
    ASSERT_TRUE(system);
    EXPECT_EQ(ReadInt(system, "System/MasterSOAPPort"), 50000);
    EXPECT_EQ(WriteInt(system, "System/MasterSOAPPort", 1), 0);
}

TEST_F(OpenTickets, OpenedAndClosedByManyThreads_StayCounted)
{
    ASSERT_TRUE(admin.Write(3, 1, "Test/K", 7));
    auto const* const ticket = admin.Open(3, 1);
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i)
        threads.emplace_back(
            [&]
            {
                for (int step = 0; step < 500; ++step)
                {
                    EXPECT_EQ(admin.Open(3, 1), ticket);
                    EXPECT_EQ(ReadInt(ticket, "Test/K"), 7);
                    EXPECT_EQ(admin.Close(3, 1), 1);
                }
            });
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(admin.Close(3, 1), 1);
    EXPECT_EQ(admin.Close(3, 1), 0);
}

TEST_F(CreatedTickets, GetTheIdAboveTheLargest)
{
    EXPECT_EQ(admin.CreateNext(Type), 1);
    EXPECT_EQ(admin.CreateNext(Type), 2);
    ASSERT_TRUE(admin.Create(Type, 7));
    EXPECT_EQ(other.CreateNext(Type), 8);
    EXPECT_EQ(admin.Operate(Type, 8, MTICKET_OP_DELETE), 1);
    EXPECT_EQ(admin.CreateNext(Type), 8);
    EXPECT_TRUE(other.Write(Type, 8, "K", 1));
}

TEST_F(CreatedTickets, WithTheLargestIdTaken_GetTheSmallestFreeOne)
{
    ASSERT_TRUE(admin.Create(Type, 0xFFFFFF));
    ASSERT_TRUE(admin.Create(Type, 0));
    EXPECT_EQ(admin.CreateNext(Type), 1);
}

TEST_F(CreatedTickets, AnyOtherIdThanNext_IsRefused)
{
    for (int const id : {0, 1, 999, -1, -3})
    {
        int made = 42;
        EXPECT_EQ(admin.Operate(Type, id, MTICKET_OP_CREATE_NEXT, &made), 0) << id;
        EXPECT_EQ(made, 42);
    }
    EXPECT_EQ(admin.Operate(Type, TICKET_ID_NEXT, MTICKET_OP_CREATE_NEXT, nullptr), 0);
    EXPECT_EQ(admin.CreateNext(-1), -1);
    EXPECT_EQ(admin.CreateNext(100), -1);
    EXPECT_THAT(Ids(admin, Type), IsEmpty());
}

TEST_F(CreatedTickets, WithoutTheRight_AreRefused)
{
    EXPECT_EQ(other.CreateNext(0), -1);
    EXPECT_EQ(other.CreateNext(17), -1);
    EXPECT_EQ(other.Create(0, 5), nullptr);
    EXPECT_EQ(admin.CreateNext(0), 1);
}

TEST_F(CreatedTickets, AreOpen)
{
    auto const* const ticket = admin.Create(Type, 4);
    ASSERT_TRUE(ticket);
    EXPECT_EQ(admin.Open(Type, 4), ticket);
    EXPECT_TRUE(WriteInt(ticket, "K", 7));
    EXPECT_EQ(other.Read(Type, 4, "K"), 7);
    EXPECT_EQ(admin.Close(Type, 4), 1);
    EXPECT_EQ(admin.Close(Type, 4), 1);
    EXPECT_EQ(admin.Close(Type, 4), 0);
}

TEST_F(CreatedTickets, ThatExistOrHaveNoAddress_AreRefused)
{
    EXPECT_EQ(admin.Create(3, 1), nullptr);
    for (auto const& [type, id] : {std::pair{-1, 1}, {100, 1}, {Type, -1}, {Type, -4}, {Type, 0x1000000}})
        EXPECT_EQ(admin.Create(type, id), nullptr) << type << '/' << id;
}

TEST_F(CreatedTickets, WithKeys_ArePartialForTheirSession)
{
    auto const* const ticket = admin.Create(Type, 4, {"Job/*", "Name"});
    ASSERT_TRUE(ticket);
    EXPECT_TRUE(WriteInt(ticket, "Job/Copies", 7));
    EXPECT_TRUE(WriteInt(ticket, "Name", 8));
    EXPECT_EQ(WriteInt(ticket, "Other", 9), 0);
    EXPECT_TRUE(other.Write(Type, 4, "Other", 10));
    EXPECT_EQ(admin.Read(Type, 4, "Other"), -1);
    EXPECT_THAT(Walked(ticket).value(), ElementsAre("Job/Copies@0", "Name@0"));
}

TEST_F(CreatedTickets, ANullKeyTable_MakesAWholeTicket)
{
    auto const* const access = admin.Access();
    auto const* const ticket = access->MCREATETICKET(access->Instance, Type, 4, nullptr);
    ASSERT_TRUE(ticket);
    EXPECT_TRUE(WriteInt(ticket, "Anything", 7));
}

TEST_F(CreatedTickets, MadeAnew_AreNotLimitedByWhatWasBefore)
{
    ASSERT_TRUE(admin.Create(Type, 1, {"A"}));
    admin.Operate(Type, 1, MTICKET_OP_DELETE);
    ASSERT_EQ(admin.CreateNext(Type), 1);
    EXPECT_TRUE(admin.Write(Type, 1, "B", 7));
}

TEST_F(PartialTickets, OtherKeysAreNeitherReadNorWritten)
{
    ASSERT_TRUE(admin.Write(3, 1, "Test/A", 1) && admin.Write(3, 1, "Test/B", 2));
    ASSERT_EQ(admin.Limit(3, 1, {"Test/A"}), 1);
    EXPECT_EQ(admin.Read(3, 1, "Test/A"), 1);
    EXPECT_EQ(admin.Read(3, 1, "Test/B"), -1);
    EXPECT_EQ(admin.Write(3, 1, "Test/B", 3), 0);
    EXPECT_EQ(admin.Delete(3, 1, "Test/B"), 0);
    unsigned long count = 42;
    auto const* const access = admin.Access();
    EXPECT_EQ(access->MGETPARAMETER(access->Instance, 3, 1, "Test/B", PARAM_COUNT, &count, -1), 0);
    EXPECT_EQ(other.Read(3, 1, "Test/B"), 2);
}

TEST_F(PartialTickets, ATable_IsCarriedOutForTheKeysThatAreSeen)
{
    ASSERT_EQ(admin.Limit(3, 1, {"Test/A*"}), 1);
    int value = 7;
    SETMULTIPAR writes[] = {{"Test/B", PARAM_INT, 0, &value, -1, true, {}},
                            {"Test/Any", PARAM_INT, 0, &value, -1, false, {}},
                            {}};
    EXPECT_EQ(admin.Access()->MSETMULTIPAR(admin.Access()->Instance, 3, 1, writes), 1);
    EXPECT_FALSE(writes[0].ok);
    EXPECT_TRUE(writes[1].ok);
    EXPECT_EQ(other.Read(3, 1, "Test/B"), -1);
    EXPECT_EQ(other.Read(3, 1, "Test/Any"), 7);
}

TEST_F(PartialTickets, AreLimitedInTheirOpenTableAndDataToo)
{
    ASSERT_TRUE(admin.Write(Type, 1, "A", 1) == 0 && admin.Create(Type, 1));
    auto const* const ticket = admin.Open(Type, 1);
    ASSERT_TRUE(WriteInt(ticket, "A", 1) && WriteInt(ticket, "B", 2));
    ASSERT_EQ(admin.Limit(Type, 1, {"A"}), 1);
    EXPECT_EQ(ReadInt(ticket, "B"), -1);
    EXPECT_THAT(Walked(ticket).value(), ElementsAre("A@0"));
    char data[1000];
    int size = sizeof data;
    ASSERT_EQ(module->GetTicketDataEntry(module.Instance(), admin.Session(), Type, 1, 0, &size, data), 0);
    std::string const xml(data, static_cast<std::size_t>(size));
    EXPECT_NE(xml.find("\"A\""), std::string::npos) << xml;
    EXPECT_EQ(xml.find("\"B\""), std::string::npos) << xml;
}

TEST_F(PartialTickets, ANullOrEmptyTable_MakesThemWhole)
{
    ASSERT_EQ(admin.Limit(3, 1, {"A"}), 1);
    EXPECT_EQ(admin.Write(3, 1, "B", 1), 0);
    EXPECT_EQ(admin.Limit(3, 1, {}), 1);
    EXPECT_EQ(admin.Write(3, 1, "B", 1), 1);
    ASSERT_EQ(admin.Limit(3, 1, {"A"}), 1);
    EXPECT_EQ(admin.Operate(3, 1, STICKET_OP_SET_PARTIAL, nullptr), 1);
    EXPECT_EQ(admin.Write(3, 1, "B", 2), 1);
}

TEST_F(PartialTickets, AMissingTicket_IsRefused)
{
    EXPECT_EQ(admin.Limit(3, 999, {"A"}), 0);
    EXPECT_EQ(admin.Limit(-1, 1, {"A"}), 0);
    EXPECT_EQ(admin.Limit(3, -3, {"A"}), 0);
}

TEST_F(TicketWalks, GoByAscendingIdAndGiveEachTicketsTable)
{
    for (int const id : {5, 1, 3})
        WriteInt(admin.Create(Type, id), "Id", id);
    std::vector<int> read;
    EXPECT_EQ(WalkTickets(other, Type,
                          [&](int type, int id, STICKET_ACCESS const* ticket)
                          {
                              EXPECT_EQ(type, Type);
                              EXPECT_EQ(ReadInt(ticket, "Id"), id);
                              read.push_back(id);
                              return true;
                          }),
              1);
    EXPECT_THAT(read, ElementsAre(1, 3, 5));
}

TEST_F(TicketWalks, EndWhenTheActionSaysSo)
{
    admin.CreateNext(Type);
    admin.CreateNext(Type);
    int calls = 0;
    EXPECT_EQ(WalkTickets(admin, Type, [&](int, int, auto) { return ++calls == 2; }), 1);
    EXPECT_EQ(calls, 1);
}

TEST_F(TicketWalks, OverNothing_Succeed_AndOverNoTypeAreRefused)
{
    auto const action = [](int, int, auto) { return true; };
    EXPECT_EQ(WalkTickets(admin, Type, action), 1);
    EXPECT_EQ(WalkTickets(admin, -1, action), 0);
    EXPECT_EQ(WalkTickets(admin, 100, action), 0);
    EXPECT_EQ(admin.Access()->MWALKTICKETS(admin.Access()->Instance, nullptr, nullptr, 3), 0);
}

TEST_F(TicketWalks, TheActionMayWriteCreateAndDelete)
{
    for (int i = 0; i < 3; ++i)
        admin.CreateNext(Type);
    std::vector<int> walked;
    EXPECT_EQ(WalkTickets(admin, Type,
                          [&](int, int id, STICKET_ACCESS const* ticket)
                          {
                              walked.push_back(id);
                              EXPECT_TRUE(WriteInt(ticket, "Seen", 1));
                              EXPECT_GT(admin.CreateNext(Type), 3);  // not walked over any more
                              bool const deletes = id == 1;
                              EXPECT_EQ(deletes ? admin.Operate(Type, 2, MTICKET_OP_DELETE) : 0, deletes);
                              return true;
                          }),
              1);
    EXPECT_THAT(walked, ElementsAre(1, 3));
    EXPECT_THAT(Ids(admin, Type), ElementsAre(1, 3, 4, 5));
}

TEST_F(TicketWalks, ATicketDeletedInTheAction_Answers0)
{
    admin.CreateNext(Type);
    WalkTickets(admin, Type,
                [&](int, int id, STICKET_ACCESS const* ticket)
                {
                    EXPECT_EQ(admin.Operate(Type, id, MTICKET_OP_DELETE), 1);
                    EXPECT_EQ(WriteInt(ticket, "K", 1), 0);
                    return true;
                });
}

TEST_F(TicketWalks, ALogoutInTheAction_EndsTheWalk)
{
    admin.CreateNext(Type);
    admin.CreateNext(Type);
    int calls = 0;
    EXPECT_EQ(WalkTickets(admin, Type,
                          [&](int, int, STICKET_ACCESS const* ticket)
                          {
                              ++calls;
                              admin.Logout();
                              EXPECT_EQ(WriteInt(ticket, "K", 1), 0);
                              return true;
                          }),
              1);
    EXPECT_EQ(calls, 1);
}

// A client may collect a ticket by the addresses of its values.
TEST_F(ParameterWalks, NumbersThatWereHandedOut_StayWhenTheirValuesAreDeleted)
{
    auto const* const ticket = admin.Create(Type, 1);
    double const number = 1.5;
    long long const large = -5000000000;
    ticket->SSETPARAMETER(ticket->Instance, "K", PARAM_DOUBLE, &number, 0);
    ticket->SSETPARAMETER(ticket->Instance, "K", PARAM_INT64, &large, 1);
    WriteInt(ticket, "K", -3, 2);
    std::vector<void const*> words;
    auto const action = [](void* context, char const*, PARAM_TYPE, void const* value, int)
    {
        static_cast<std::vector<void const*>*>(context)->push_back(value);
        return true;
    };
    ASSERT_EQ(ticket->SWALKPARAMETERS(ticket->Instance, action, &words, "", 8000), 1);
    ASSERT_EQ(words.size(), 3u);
    admin.Delete(Type, 1, "K");
    EXPECT_EQ(*static_cast<double const*>(words[0]), 1.5);
    EXPECT_EQ(*static_cast<long long const*>(words[1]), large);
    EXPECT_EQ(*static_cast<int const*>(words[2]), -3);
}

TEST_F(ParameterWalks, TheActionMayWriteAndEndTheSession)
{
    auto const* const ticket = admin.Create(Type, 1);
    for (int pos = 0; pos < 10; ++pos)
        ticket->SSETPARAMETER(ticket->Instance, "K", PARAM_STRING, "text", pos);
    struct STATE
    {
        CLIENT const& client;
        int calls = 0;
    } state{admin};
    auto const action = [](void* context, char const* key, PARAM_TYPE, void const* value, int pos)
    {
        auto& now = *static_cast<STATE*>(context);
        EXPECT_TRUE(now.client.Write(Type, 1, key, 7, pos));
        EXPECT_STREQ(static_cast<char const*>(value), "text");
        if (++now.calls == 3)
            now.client.Logout();
        return true;
    };
    EXPECT_EQ(ticket->SWALKPARAMETERS(ticket->Instance, action, &state, "", 8000), 1);
    EXPECT_EQ(state.calls, 3);
    EXPECT_EQ(other.Read(Type, 1, "K", 2), 7);
    EXPECT_EQ(other.Read(Type, 1, "K", 3), -1);
}
