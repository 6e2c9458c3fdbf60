// Logins, and many threads at once.
#include "tests/server/ServerTest.h"

#include <atomic>
#include <set>
#include <thread>

using standin::SystemTicket;

namespace
{
// Runs that many threads and waits for them; each gets its number.
template <typename Work>
void InParallel(int threads, Work const& work)
{
    std::vector<std::thread> running;
    for (int i = 0; i < threads; ++i)
        running.emplace_back([&work, i] { work(i); });
    for (std::thread& thread : running)
        thread.join();
}
}  // namespace

class Sessions : public ServerTest
{
};

TEST_F(Sessions, Login_KnowsTheUser)
{
    auto const session = Server().Login("operator", "secret");
    ASSERT_TRUE(session);
    EXPECT_EQ(session->Who().name, "operator");
    EXPECT_EQ(session->Who().role, 1);
    EXPECT_EQ(session->Who().ticketId, 2);
    EXPECT_FALSE(session->IsAdministrator());
    EXPECT_TRUE(As("admin").IsAdministrator());
}

TEST_F(Sessions, Login_WithAWrongPasswordOrUser_GivesNothing)
{
    EXPECT_FALSE(Server().Login("operator", "Secret"));
    EXPECT_FALSE(Server().Login("operator", ""));
    EXPECT_FALSE(Server().Login("nobody", "secret"));
    EXPECT_FALSE(Server().Login("", ""));
}

TEST_F(Sessions, Login_OfWhoGuesses_IsAnsweredLaterAndLater_AndARightOneAtOnce)
{
    auto const duration = [this](char const* password)
    {
        auto const begin = std::chrono::steady_clock::now();
        EXPECT_EQ(Server().Login("operator", password) != nullptr, password == std::string_view("secret"));
        return std::chrono::steady_clock::now() - begin;
    };
    for (int i = 0; i < 8; ++i)
        duration("guess");
    EXPECT_GE(duration("guess"), std::chrono::milliseconds(800));
    EXPECT_LT(duration("secret"), std::chrono::milliseconds(1600)) << "as a further guess would have to wait";
}

TEST_F(Sessions, Login_WithAFailingStore_Throws)
{
    Server();
    site->FailAll(true);
    EXPECT_THROW(Server().Login("operator", "secret"), standin::StoreError);
}

TEST_F(Sessions, Opening_WithAFailingStore_Throws)
{
    store = std::make_unique<standin::MemoryStore>(site);
    site->FailAll(true);
    EXPECT_THROW(Server(), standin::StoreError);
}

TEST_F(Sessions, Numbers_AreNeverGivenTwice)
{
    auto const first = Server().Login("operator", "secret");
    Server().Logout(*first);
    auto const second = Server().Login("operator", "secret");
    EXPECT_NE(first->Number(), second->Number());
}

TEST_F(Sessions, AfterLogout_EverythingIsRefused)
{
    Set(Job, "K", 7);
    auto& session = As("admin");
    EXPECT_TRUE(Server().Logout(session));
    int value = 1;
    SETMULTIPAR table[] = {{"K", PARAM_INT, 0, &value, -1, true, {}}, {}};
    GETMULTIPAR reads[] = {{"K", PARAM_INT, 0, &value, -1, true, {}}, {}};
    EXPECT_FALSE(Get(session, Job, "K", PARAM_INT, &value, -1));
    EXPECT_FALSE(Set(session, Job, "K", PARAM_INT, &value, -1));
    EXPECT_FALSE(SetTable(session, Job, table));
    EXPECT_FALSE(table[0].ok);
    EXPECT_FALSE(GetTable(session, Job, reads));
    EXPECT_FALSE(reads[0].ok);
    EXPECT_FALSE(Tickets().Create(session, {3, 50}));
    EXPECT_FALSE(Tickets().Delete(session, Job));
    EXPECT_FALSE(Tickets().Values(session, Job, 0, ""));
    EXPECT_FALSE(Server().Logout(session));
    EXPECT_EQ(value, 1);
}

TEST_F(Sessions, LoginsInParallel_AllGetSessionsOfTheirOwn)
{
    Server();
    std::mutex lock;
    std::set<unsigned long long> numbers;
    InParallel(8,
               [&](int i)
               {
                   auto const session = Server().Login(i % 2 ? "operator" : "guest", "secret");
                   ASSERT_TRUE(session);
                   EXPECT_FALSE(Server().Login("operator", "wrong"));
                   std::lock_guard const guard(lock);
                   numbers.insert(session->Number());
               });
    EXPECT_EQ(numbers.size(), 8u);
}

// Every text that is ever written consists of one letter repeated, so a torn or freed one shows.
TEST_F(Sessions, ReadersWritersAndLogins_AtOnce_SeeWholeValuesOnly)
{
    Server();
    std::atomic<int> broken{0};
    std::atomic<int> failed{0};
    InParallel(6,
               [&](int i)
               {
                   for (int round = 0; round < 20; ++round)
                   {
                       auto const session = Server().Login("operator", "secret");
                       for (int step = 0; step < 40; ++step)
                       {
                           std::string const text(static_cast<std::size_t>(20 + step),
                                                  static_cast<char>('a' + step % 26));
                           if (i % 2 && !Set(*session, Job, "T", PARAM_STRING, text.c_str(), step % 3))
                               ++failed;
                           char const* read = nullptr;
                           if (Get(*session, Job, "T", PARAM_STRING, &read, step % 3) &&
                               std::string(read) != std::string(std::string(read).size(), read[0]))
                               ++broken;
                       }
                       Server().Logout(*session);
                   }
               });
    EXPECT_EQ(broken, 0);
    EXPECT_EQ(failed, 0);
    EXPECT_EQ(RetiredTexts(), 0u);
}

TEST_F(Sessions, CountersWrittenByOneThreadEach_AllArriveInMemoryAndStore)
{
    auto& session = As("operator");
    InParallel(4,
               [&](int i)
               {
                   std::string const key = "Counter" + std::to_string(i);
                   for (int count = 1; count <= 100; ++count)
                       Set(session, Job, key.c_str(), PARAM_INT, &count, -2);
               });
    for (int restart = 0; restart < 2; ++restart)
    {
        for (int i = 0; i < 4; ++i)
            EXPECT_EQ(Int(Job, ("Counter" + std::to_string(i)).c_str(), 99), 100);
        Restart();
    }
}

TEST_F(Sessions, TicketsMadeAndDeletedWhileOthersRead_NeverMixUp)
{
    auto& session = As("operator");
    std::atomic<bool> done{false};
    std::atomic<int> wrong{0};
    InParallel(3,
               [&](int i)
               {
                   standin::TicketAddress const address{3, 1000};
                   int const seven = 7;
                   for (int round = 0; i == 0 && round < 300; ++round)
                   {
                       Tickets().Create(session, address);
                       Set(session, address, "K", PARAM_INT, &seven, -1);
                       Tickets().Delete(session, address);
                   }
                   if (i == 0)
                       done = true;
                   for (int value = 7; i != 0 && !done;)
                       if (Get(session, address, "K", PARAM_INT, &value, -1) && value != 7)
                           ++wrong;
               });
    EXPECT_EQ(wrong, 0);
    EXPECT_FALSE(Exists({3, 1000}));
}

TEST_F(ServerTest, Session_RemembersWhereItsClientIs)
{
    standin::Session& session = As("operator");
    EXPECT_EQ(session.EndPoint(), "");
    EXPECT_EQ(session.Folder(standin::Session::PreviewFolder), "");
    session.SetEndPoint("127.0.0.1:50106");
    session.SetFolder(standin::Session::PreviewFolder, "/preview");
    session.SetFolder(standin::Session::ThumbnailFolder, "/thumbnail");
    EXPECT_EQ(session.EndPoint(), "127.0.0.1:50106");
    EXPECT_EQ(session.Folder(standin::Session::PreviewFolder), "/preview");
    EXPECT_EQ(session.Folder(standin::Session::ThumbnailFolder), "/thumbnail");
    EXPECT_EQ(As("guest").EndPoint(), "");
}
