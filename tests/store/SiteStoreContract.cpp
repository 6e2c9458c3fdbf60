#include "tests/store/SiteStoreContract.h"

#include <future>
#include <gmock/gmock.h>

using namespace standin;
using namespace std::chrono_literals;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
struct Content
{
    std::vector<TicketChange> tickets;
    std::vector<User> users;
};

Content ContentOf(SiteStore& store)
{
    Content content;
    store.ReadContent([&](TicketChange&& ticket) { content.tickets.push_back(std::move(ticket)); },
                      [&](User&& user) { content.users.push_back(std::move(user)); }, {});
    return content;
}

std::vector<TicketAddress> AddressesIn(Content const& content)
{
    std::vector<TicketAddress> addresses;
    for (TicketChange const& ticket : content.tickets)
        addresses.push_back(ticket.address);
    return addresses;
}
}  // namespace

TEST_P(SiteStoreContract, Opening_ThatIsKept_MakesOthersWait)
{
    auto const first = Open(true);
    auto other = std::async(std::launch::async, [this] { return Open(); });
    EXPECT_EQ(other.wait_for(200ms), std::future_status::timeout);
    first->EndOpening();
    EXPECT_NE(other.get(), nullptr);
}

TEST_P(SiteStoreContract, Opening_ThatIsKept_EndsWithTheHandle)
{
    auto first = Open(true);
    auto other = std::async(std::launch::async, [this] { return Open(); });
    EXPECT_EQ(other.wait_for(100ms), std::future_status::timeout);
    first.reset();
    EXPECT_NE(other.get(), nullptr);
}

TEST_P(SiteStoreContract, EndOpening_OfWhatIsNotKept_LeavesAnothersAlone)
{
    auto const first = Open();
    first->EndOpening();
    auto const keeper = Open(true);
    first->EndOpening();
    auto other = std::async(std::launch::async, [this] { return Open(); });
    EXPECT_EQ(other.wait_for(100ms), std::future_status::timeout);
    keeper->EndOpening();
    EXPECT_NE(other.get(), nullptr);
}

TEST_P(SiteStoreContract, Opening_IsKeptUntilItEnds)
{
    EXPECT_FALSE(Open()->KeepsOpening());
    auto const keeper = Open(true);
    EXPECT_TRUE(keeper->KeepsOpening());
    keeper->EndOpening();
    EXPECT_FALSE(keeper->KeepsOpening());
}

TEST_P(SiteStoreContract, Tidiness_LastsWhileEverybodyLeavesInOrder)
{
    auto store = Open();
    store->NoteTidy();
    for (int round = 0; round < 2; ++round)
    {
        EXPECT_TRUE(store->IsTidy());
        store->Leave();
        store = Open();
    }
    EXPECT_TRUE(store->IsTidy());
}

TEST_P(SiteStoreContract, Tidiness_EndsWithADeath_UntilSomebodySaysSoAnew)
{
    auto store = Open();
    for (int round = 0; round < 2; ++round)
    {
        store->NoteTidy();
        store.reset();  // without leaving
        store = Open();
        EXPECT_FALSE(store->IsTidy());
        store->NoteTidy();
        EXPECT_TRUE(store->IsTidy());
        store->Bury([](Estate const&) {});
    }
}

TEST_P(SiteStoreContract, UsersTurn_IsForOneAtATime)
{
    auto const store = Open();
    auto const other = Open();
    for (int round = 0; round < 2; ++round)
    {
        auto turn = store->TakeUsersTurn(10s);
        ASSERT_NE(turn, nullptr);
        EXPECT_EQ(other->TakeUsersTurn(50ms), nullptr);
        EXPECT_EQ(store->TakeUsersTurn(50ms), nullptr);
        auto next = std::async(std::launch::async, [&] { return other->TakeUsersTurn(20s); });
        EXPECT_EQ(next.wait_for(50ms), std::future_status::timeout);
        turn.reset();
        EXPECT_NE(next.get(), nullptr);
    }
}

TEST_P(SiteStoreContract, UsersTurn_HoldsUpNothingElse)
{
    auto const store = Open();
    auto const turn = store->TakeUsersTurn(10s);
    auto const other = Open();
    other->PutUser({"anna", "$y$", 1, 5});
    Writer(*other).Make(Job);
    EXPECT_TRUE(store->FindUser("anna"));
}

TEST_P(SiteStoreContract, Check_OfASoundSite_FindsNothingAndTellsHowFarItIs)
{
    auto const store = Open();
    Writer writer(*store);
    writer.Make(Job);
    writer.Put(Job, "Text", 3, Bytes(PARAM_STRING, "text"));
    writer.Put(Job, "Int", 0, -5);
    writer.Do(Creation(OtherJob).Own(TicketChange::Owner::ThisProgram));
    long long done = -1;
    long long total = 0;
    auto const progress = [&](long long nowDone, long long ofTotal)
    {
        EXPECT_GE(nowDone, done);
        done = nowDone;
        total = ofTotal;
    };
    EXPECT_THAT(store->Check(progress), IsEmpty());
    EXPECT_EQ(done, total);
    EXPECT_GT(total, 0);
}

TEST_P(SiteStoreContract, Measure_CountsWhatThereIs)
{
    auto const store = Open();
    Writer writer(*store);
    writer.Make(Job);
    writer.Make(OtherJob);
    writer.Put(Job, "Key", 0, 1);
    store->PutUser({"anna", "$y$", 1, 5});
    auto const sizes = store->Measure();
    EXPECT_EQ(sizes.tickets, 2);
    EXPECT_EQ(sizes.users, 1);
    EXPECT_EQ(sizes.records, 3);
    EXPECT_GT(sizes.databaseBytes, 0);
}

TEST_P(SiteStoreContract, Content_IsEveryTicketInOrderWithItsValues_AndEveryUser)
{
    auto const store = Open();
    Writer writer(*store);
    std::string const large(100'000, 'x');
    writer.Make(OtherJob);
    writer.Make(Job);
    writer.Put(Job, "B", 1, Bytes(PARAM_BINSTRING, std::string_view("\0\xFF", 2)));
    writer.Put(Job, "B", 0, 7);
    writer.Put(Job, "A", 2, Bytes(PARAM_STRING, large));
    writer.Put(Job, "", 0, 1);
    store->PutUser({"ben", "$y$b", 1, 5});
    store->PutUser({"anna", "$y$a", 16, 4});
    Content const content = ContentOf(*store);
    ASSERT_THAT(AddressesIn(content), ElementsAre(Job, OtherJob));
    EXPECT_THAT(content.tickets[1].parameters, IsEmpty());
    StoreValues found;
    for (ParameterChange const& each : content.tickets[0].parameters)
        found.emplace(std::pair(each.key, each.pos), KEPT_VALUE(each.value.ToStored()));
    EXPECT_EQ(found, ValuesOf(*store, Job));
    EXPECT_EQ(content.tickets[0].kind, TicketChange::Create);
    ASSERT_EQ(content.users.size(), 2u);
    EXPECT_EQ(content.users[0].name, "anna");
    EXPECT_EQ(content.users[0].passwordHash, "$y$a");
    EXPECT_EQ(content.users[1].ticketId, 5);
}

TEST_P(SiteStoreContract, Content_LeavesOutWhatAProgramOwns)
{
    auto const store = Open();
    Writer writer(*store);
    writer.Make(Job);
    writer.Do(Creation(OtherJob).Own(TicketChange::Owner::ThisProgram));
    EXPECT_THAT(AddressesIn(ContentOf(*store)), ElementsAre(Job));
}

TEST_P(SiteStoreContract, Content_IsThatOfOneMoment)
{
    auto const store = Open();
    auto const other = Open();
    Writer writer(*other);
    writer.Make(Job);
    for (int id = 2; id < 1500; ++id)
        writer.Make({3, id});
    bool isFirst = true;
    std::size_t tickets = 0;
    std::vector<User> users;
    store->ReadContent(
        [&](TicketChange&&)
        {
            ++tickets;
            if (!std::exchange(isFirst, false))
                return;
            writer.Make({3, 2000});
            writer.Remove({3, 1400});
            other->PutUser({"late", "$y$", 1, 1});
        },
        [&](User&& user) { users.push_back(std::move(user)); }, {});
    EXPECT_EQ(tickets, 1499u);
    EXPECT_THAT(users, IsEmpty());
}

TEST_P(SiteStoreContract, Content_MadeAnewFromItself_IsTheSame)
{
    auto const store = Open();
    Writer writer(*store);
    writer.Make(Job);
    writer.Put(Job, "Gap", 5, -1);
    writer.Put(Job, "Text", 0, Bytes(PARAM_STRING, ""));
    StoreValues const before = ValuesOf(*store, Job);
    Content const content = ContentOf(*store);
    writer.Remove(Job);
    EXPECT_EQ(writer.Do(content.tickets.at(0)).kind, CommitOutcome::Committed);
    EXPECT_EQ(ValuesOf(*store, Job), before);
}
