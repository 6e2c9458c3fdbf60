// local.get.progress: how far the session's transfer is, as another thread sees it.
#include "comgui/session/TJobIdentification.h"
#include "standin/module/ModuleCodes.h"
#include "tests/module/NotificationListener.h"
#include "tests/module/ValueText.h"
#include <filesystem>
#include <fstream>
#include <functional>
#include <gmock/gmock.h>
#include <set>
#include <thread>

using namespace standin;
using testing::AllOf;
using testing::Ge;
using testing::IsEmpty;
using testing::Le;

namespace
{
constexpr long long FileSize = 300LL << 20;

// A file of that size whose few bytes are spread all over it: many pieces to copy, and little to store.
std::string WriteSparse(std::filesystem::path const& path)
{
    constexpr long long Distance = 128 << 10;
    std::ofstream file(path, std::ios::binary);
    for (long long at = 0; at < FileSize; at += Distance)
        file.seekp(at).put('x');
    file.close();
    std::filesystem::resize_file(path, static_cast<std::uintmax_t>(FileSize));
    return path.string();
}

class Progress : public ClientTest
{
protected:
    int Ask(void* hSession, TICKET const& ticket, void* hInstance) const
    {
        return module->SendCommandEntry(hInstance, hSession, "local.get.progress", 0,
                                        const_cast<STICKET_ACCESS*>(ticket.Access()));
    }
    int Ask(void* hSession, TICKET const& ticket) const { return Ask(hSession, ticket, module.Instance()); }

    // Asks until the session has ended or the transfer. Gives what Done was, each number once.
    std::set<long long> Watch(void* hSession, std::atomic<bool> const& isOver,
                              std::function<void()> const& onMoving = {}) const
    {
        std::set<long long> seen;
        TICKET const ticket(factory, nullptr);
        while (!isOver && Ask(hSession, ticket) == MODULE_DONE)
        {
            long long done = -1;
            long long size = -1;
            bool const hasDone = ticket.Get("Transfer/Done", PARAM_INT64, &done);
            bool const hasSize = ticket.Get("Transfer/Size", PARAM_INT64, &size);
            EXPECT_EQ(hasDone, hasSize);
            if (!hasDone)
                continue;
            EXPECT_EQ(size, FileSize);
            EXPECT_THAT(done, AllOf(Ge(seen.empty() ? 0 : *seen.rbegin()), Le(size)));
            bool const hasMoved = seen.insert(done).second && seen.size() == 3;
            if (hasMoved && onMoving)
                onMoving();
        }
        return seen;
    }

    // What is seen of one transfer by another thread.
    std::set<long long> SeenOf(std::function<void()> const& transfer) const
    {
        std::atomic<bool> isOver{false};
        std::set<long long> seen;
        std::thread watch([&] { seen = Watch(other.Session(), isOver); });
        transfer();
        isOver = true;
        watch.join();
        return seen;
    }

    // A watcher that does not get a turn sees little, so there is more than one try.
    void ExpectToMove(std::function<void()> const& transfer) const
    {
        std::size_t most = 0;
        for (int i = 0; i < 20 && most < 3; ++i)
            most = std::max(most, SeenOf(transfer).size());
        EXPECT_GE(most, 3u);
        ExpectNone(other);
    }

    void ExpectNone(CLIENT const& client) const
    {
        TICKET const ticket(factory, nullptr);
        ticket.Set("Transfer/Done", "stale");
        ticket.Set("Transfer/Size", 7, 3);
        ticket.Set("Transfer/Other", 7);
        EXPECT_EQ(Ask(client.Session(), ticket), MODULE_DONE);
        EXPECT_EQ(ContentOf(ticket.Access()), std::vector<std::string>{"Transfer/Other@0=7"});
    }

    TICKET_FACTORY const factory{};
    std::string local = WriteSparse(folder.Path() / "local");
    char target[10] = "$(TEMP)/a";
};
}  // namespace

TEST_F(Progress, NeedsATicketAndASession)
{
    TICKET const ticket(factory, nullptr);
    STICKET_ACCESS const* const others = other.Open(0, 0);  // which this user may not write
    void* const ended = LogIn();
    module->LogoutEntry(module.Instance(), ended);
    auto const ask = [&](void* hSession, char const* command, void const* data)
    { return module->SendCommandEntry(module.Instance(), hSession, command, 0, const_cast<void*>(data)); };
    char const* const name = "local.get.progress";
    EXPECT_EQ(ask(other.Session(), name, nullptr), MODULE_INVALID_ARGUMENT);
    EXPECT_EQ(ask(other.Session(), name, others), MODULE_INVALID_ARGUMENT);
    EXPECT_EQ(ask(nullptr, name, ticket.Access()), MODULE_UNKNOWN_SESSION);
    EXPECT_EQ(ask(ended, name, ticket.Access()), MODULE_UNKNOWN_SESSION);
    EXPECT_EQ(ask(ended, name, nullptr), MODULE_UNKNOWN_SESSION);
    EXPECT_EQ(ask(other.Session(), "local.get.Progress", ticket.Access()), MODULE_NOT_SUPPORTED);
    EXPECT_EQ(Ask(other.Session(), ticket, nullptr), MODULE_UNKNOWN_INSTANCE);
    EXPECT_THAT(ContentOf(ticket.Access()), IsEmpty());
}

TEST_F(Progress, WithoutATransfer_IsNone) { ExpectNone(other); }

TEST_F(Progress, OfAFileThatIsPut_Moves)
{
    ExpectToMove(
        [&]
        {
            EXPECT_EQ(module->PutFileSyncEntry(module.Instance(), other.Session(), local.data(), target),
                      MODULE_DONE);
        });
}

TEST_F(Progress, OfAFileThatIsFetched_Moves)
{
    ASSERT_EQ(module->PutFileSyncEntry(module.Instance(), other.Session(), local.data(), target),
              MODULE_DONE);
    std::string back = (folder.Path() / "back").string();
    ExpectToMove(
        [&]
        {
            EXPECT_EQ(module->GetFileSyncEntry(module.Instance(), other.Session(), target, back.data()),
                      MODULE_DONE);
        });
}

TEST_F(Progress, OfAJob_Moves)
{
    char upload[] = "$(UPLOADJOB)";
    char name[] = "job";
    TJobIdentification job{};
    job.nSize = sizeof job;
    job.pszUploadFolder = upload;
    ExpectToMove(
        [&]
        {
            EXPECT_EQ(module->SendJobEntry(module.Instance(), other.Session(), &job, local.data(), name),
                      MODULE_DONE);
        });
}

TEST_F(Progress, OfWhatTheServersThreadCarries_Moves)
{
    LISTENER listener;
    other.Register(listener);
    std::size_t begun = 0;
    ExpectToMove(
        [&]
        {
            EXPECT_EQ(module->PutFileEntry(module.Instance(), other.Session(), local.data(), target),
                      MODULE_DONE);
            EXPECT_EQ(listener.Wait(++begun).size(), begun);
        });
    other.Logout();
}

TEST_F(Progress, IsOfTheSession_ThroughAnyInstance)
{
    void* another = nullptr;
    ASSERT_EQ(module->Open(&another), MODULE_DONE);
    ASSERT_NE(another, module.Instance());
    bool isSeen = false;
    for (int i = 0; i < 20 && !isSeen; ++i)
    {
        std::atomic<bool> isOver{false};
        std::thread watch(
            [&]
            {
                TICKET const ticket(factory, nullptr);
                while (!isOver && !isSeen)
                {
                    EXPECT_EQ(Ask(other.Session(), ticket, another), MODULE_DONE);
                    isSeen = ContentOf(ticket.Access()).size() == 2;
                    ExpectNone(admin);
                }
            });
        EXPECT_EQ(module->PutFileSyncEntry(module.Instance(), other.Session(), local.data(), target),
                  MODULE_DONE);
        isOver = true;
        watch.join();
    }
    EXPECT_TRUE(isSeen);
}

TEST_F(Progress, WhileALogoutCutsTheTransfer_IsAnsweredToItsEnd)
{
    bool isCut = false;
    for (int i = 0; i < 20 && !isCut; ++i)
    {
        CLIENT const client(*this, LogIn());
        std::atomic<bool> isOver{false};
        std::thread logout;
        std::thread watch(
            [&]
            {
                Watch(client.Session(), isOver,
                      [&] { logout = std::thread([&] { EXPECT_EQ(client.Logout(), MODULE_DONE); }); });
            });
        int const code = module->PutFileSyncEntry(module.Instance(), client.Session(), local.data(), target);
        isOver = true;
        watch.join();
        isCut = code == MODULE_TRANSFER_CUT;
        EXPECT_TRUE(isCut || code == MODULE_DONE) << code;
        if (!logout.joinable())
            continue;
        logout.join();
        TICKET const ticket(factory, nullptr);
        EXPECT_EQ(Ask(client.Session(), ticket), MODULE_UNKNOWN_SESSION);
        EXPECT_THAT(ContentOf(ticket.Access()), IsEmpty());
    }
    EXPECT_TRUE(isCut);
}
