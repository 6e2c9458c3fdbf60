#include "standin/server/site/Site.h"

#include "comgui/ticket/TICKET_ID.h"
#include "standin/server/files/AtomicFile.h"
#include "standin/server/files/Descriptor.h"
#include "standin/server/sessions/Password.h"
#include "standin/server/site/RulesOfSite.h"
#include "standin/server/site/Seed.h"
#include "standin/server/store/sqlite/SqliteStore.h"
#include "standin/server/tickets/TicketXml.h"
#include "tests/server/MemoryFolder.h"
#include "tests/server/OpenedSite.h"
#include "tests/support/ChildProcess.h"
#include "tests/support/Files.h"
#include "tests/support/sanitizers.h"
#include <algorithm>
#include <atomic>
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <fcntl.h>
#include <future>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <map>
#include <random>
#include <set>
#include <sqlite3.h>
#include <sys/file.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

using namespace standin;
using testing::AllOf;
using testing::ContainsRegex;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::StartsWith;

namespace
{
std::filesystem::path const ShippedSeed = COMGUI_TEST_SEED;

StoreContent NoContent() { throw StoreError("the site is not there"); }

class SiteFolder : public testing::Test
{
protected:
    std::filesystem::path Folder() const { return folder / "site"; }
    std::filesystem::path File(std::string const& name) const { return Folder() / name; }
    void MakeSite() const { OpenedSite(Folder(), ShippedSeed); }
    void MakeSiteNamed(std::string const& name) const
    {
        EXPECT_TRUE(OpenedSite(Folder(), ShippedSeed).Put("System/Name", name));
    }
    std::string NameOfSite() const
    {
        return OpenedSite(Folder(), ShippedSeed).Text(SystemTicket, "System/Name");
    }
    std::string ReasonOfOpening(std::filesystem::path const& seed = ShippedSeed) const
    {
        return ReasonOfOpening(Folder(), seed);
    }
    static std::string ReasonOfOpening(std::filesystem::path const& where, std::filesystem::path const& seed)
    {
        try
        {
            OpenedSite(where, seed);
        }
        catch (StoreError const& error)
        {
            return error.what();
        }
        catch (FileError const& error)
        {
            return error.what();
        }
        return "opened";
    }
    // What opening says on stderr.
    std::string Said(std::filesystem::path const& seed = ShippedSeed) const
    {
        testing::internal::CaptureStderr();
        try
        {
            OpenedSite(Folder(), seed);
        }
        catch (...)
        {
            testing::internal::GetCapturedStderr();
            throw;
        }
        return testing::internal::GetCapturedStderr();
    }
    std::vector<std::string> SetAside() const
    {
        std::vector<std::string> names;
        for (auto const& entry : std::filesystem::directory_iterator(Folder()))
            if (entry.path().filename().string().find(".damaged-") != std::string::npos)
                names.push_back(entry.path().filename().string());
        std::sort(names.begin(), names.end());
        return names;
    }

    MemoryFolder folder;
};

class Environment : public testing::Test
{
protected:
    Environment()
    {
        for (char const* const name : {"COMGUI_SITE", "XDG_DATA_HOME", "HOME"})
        {
            if (char const* const value = std::getenv(name))
                m_before[name] = value;
            unsetenv(name);
        }
    }
    ~Environment() override
    {
        for (char const* const name : {"COMGUI_SITE", "XDG_DATA_HOME", "HOME"})
            unsetenv(name);
        for (auto const& [name, value] : m_before)
            setenv(name.c_str(), value.c_str(), 1);
    }

private:
    std::map<std::string, std::string> m_before;
};
using SiteFolderByEnvironment = Environment;
}  // namespace

TEST_F(SiteFolderByEnvironment, IsWhatComguiSiteSays)
{
    setenv("COMGUI_SITE", "/somewhere/else/", 1);
    setenv("XDG_DATA_HOME", "/data", 1);
    EXPECT_EQ(SiteName::OfThisUser().folder, "/somewhere/else");
}

TEST_F(SiteFolderByEnvironment, RelativeComguiSite_IsMadeAbsolute)
{
    setenv("COMGUI_SITE", "my/../site", 1);
    EXPECT_EQ(SiteName::OfThisUser().folder, std::filesystem::current_path() / "site");
}

TEST_F(SiteFolderByEnvironment, OtherwiseLiesInTheDataFolder)
{
    setenv("COMGUI_SITE", "", 1);
    setenv("XDG_DATA_HOME", "/data", 1);
    setenv("HOME", "/home/me", 1);
    EXPECT_EQ(SiteName::OfThisUser().folder, "/data/comgui/site");
}

TEST_F(SiteFolderByEnvironment, WithoutADataFolder_LiesInTheHome)
{
    setenv("HOME", "/home/me", 1);
    EXPECT_EQ(SiteName::OfThisUser().folder, "/home/me/.local/share/comgui/site");
    setenv("XDG_DATA_HOME", "relative", 1);
    EXPECT_EQ(SiteName::OfThisUser().folder, "/home/me/.local/share/comgui/site");
}

TEST_F(SiteFolderByEnvironment, WithoutAnything_SaysWhatToSet)
{
    try
    {
        SiteName::OfThisUser();
        FAIL() << "found a folder";
    }
    catch (StoreError const& error)
    {
        EXPECT_THAT(error.what(), HasSubstr("set COMGUI_SITE"));
    }
}

TEST_F(SiteFolder, FirstStart_MakesFoldersForThisUserAlone)
{
    MakeSite();
    for (char const* const name :
         {"", "tickets", "temp", "job", "upload", "preview", "log", "hot", "linearisation",
          "linearisation/lab", "remote", "remote/wcc", "profiles", "profiles/paper"})
    {
        struct stat found = {};
        ASSERT_EQ(stat(File(name).c_str(), &found), 0) << name;
        EXPECT_TRUE(S_ISDIR(found.st_mode)) << name;
        EXPECT_EQ(found.st_mode & 07777, 0700u) << name;
    }
}

// Hashes of passwords are in it.
TEST_F(SiteFolder, FirstStart_InAFolderThatOthersMayRead_MakesADatabaseAndASeedThatTheyMayNot)
{
    std::filesystem::create_directories(Folder());
    ASSERT_EQ(chmod(Folder().c_str(), 0755), 0);
    OpenedSite const site(Folder(), ShippedSeed);
    for (char const* const name : {"site.db", "site.db-wal", "site.db-shm", "site.lock", "seed.xml"})
    {
        struct stat found = {};
        ASSERT_EQ(stat(File(name).c_str(), &found), 0) << name;
        EXPECT_EQ(found.st_mode & 07777, 0600u) << name;
    }
}

TEST_F(SiteFolder, FirstStart_FillsTheDatabaseFromTheSeedAndSaysNothing)
{
    EXPECT_EQ(Said(), "");
    OpenedSite site(Folder(), ShippedSeed);
    EXPECT_EQ(site.Tickets().size(), Seed::Read(ShippedSeed).tickets.size());
    EXPECT_EQ(site.Text({3, 1}, "Job/Identification/Name"), "Spring catalogue");
    EXPECT_EQ(ContentOf(File("seed.xml")), ContentOf(ShippedSeed));
}

TEST_F(SiteFolder, FirstStart_UsersHaveHashesRolesAndTickets)
{
    OpenedSite site(Folder(), ShippedSeed);
    auto const admin = site.Store().FindUser("admin");
    auto const printer = site.Store().FindUser("operator");
    ASSERT_TRUE(admin && printer);
    EXPECT_EQ(admin->role, 16);
    EXPECT_EQ(printer->role, 1);
    EXPECT_EQ(site.Text({17, admin->ticketId}, "User/Name"), "admin");
    EXPECT_EQ(site.Text({17, printer->ticketId}, "User/Name"), "operator");
    EXPECT_TRUE(Password::Verify("admin", admin->passwordHash));
    EXPECT_TRUE(Password::Verify("operator", printer->passwordHash));
    EXPECT_FALSE(Password::Verify("operator", admin->passwordHash));
}

TEST_F(SiteFolder, SecondStart_KeepsWhatWasChanged)
{
    MakeSiteNamed("Changed");
    EXPECT_EQ(Said(), "");
    EXPECT_EQ(NameOfSite(), "Changed");
}

TEST_F(SiteFolder, DeletedDatabase_IsMadeAnewFromTheEditedSeed)
{
    MakeSite();
    std::string seed = ContentOf(File("seed.xml"));
    seed.replace(seed.find(">Print Server<"), 14, ">Edited<");
    WriteFile(File("seed.xml"), seed);
    EXPECT_EQ(NameOfSite(), "Print Server");
    std::filesystem::remove(File("site.db"));
    EXPECT_EQ(NameOfSite(), "Edited");
    EXPECT_EQ(ContentOf(File("seed.xml")), seed);
}

TEST_F(SiteFolder, InstallFolder_IsTheSitesFolder)
{
    OpenedSite site(Folder(), ShippedSeed);
    EXPECT_EQ(site.site.folder(), Folder());
    EXPECT_EQ(site.Text(SystemTicket, "System/InstallFolder"), Folder().string());
}

TEST_F(SiteFolder, InstallFolder_FollowsAMovedSite)
{
    MakeSiteNamed("Moved");
    std::filesystem::rename(Folder(), folder / "elsewhere");
    OpenedSite site(folder / "elsewhere" / "", ShippedSeed);
    EXPECT_EQ(site.Text(SystemTicket, "System/InstallFolder"), (folder / "elsewhere").string());
    EXPECT_EQ(site.Text(SystemTicket, "System/Name"), "Moved");
}

TEST_F(SiteFolder, InstallFolder_ThatIsNoSingleText_IsReplaced)
{
    {
        OpenedSite site(Folder(), ShippedSeed);
        EXPECT_TRUE(site.Put(SystemTicket, "System/InstallFolder", TicketValue::Int(0), 1));
    }
    OpenedSite site(Folder(), ShippedSeed);
    int values = 0;
    site.Store().Load(SystemTicket, [&values](std::string_view key, int, StoredValue const&)
                      { values += key == "System/InstallFolder" ? 1 : 0; });
    EXPECT_EQ(values, 1);
    EXPECT_EQ(site.Text(SystemTicket, "System/InstallFolder"), Folder().string());
}

TEST_F(SiteFolder, FolderKeysThatLeaveTheSite_MakeNoFolder)
{
    {
        OpenedSite site(Folder(), ShippedSeed);
        EXPECT_TRUE(site.Put("System/Folders/Temp", "$(INSTALL)/../outside"));
    }
    EXPECT_EQ(Said(), "");
    EXPECT_FALSE(std::filesystem::exists(folder / "outside"));
}

TEST_F(SiteFolder, SystemTicketFile_IsWrittenAtEveryStartAndAfterEveryChange)
{
    MakeSite();
    std::filesystem::remove(File("tickets/SYS_0000.xml"));
    OpenedSite site(Folder(), ShippedSeed);
    EXPECT_THAT(
        ContentOf(File("tickets/SYS_0000.xml")),
        AllOf(HasSubstr("key=\"System/MasterSOAPPort\" type=\"int\">50000<"), HasSubstr(">Print Server<")));
    EXPECT_TRUE(site.Put("System/Name", "Changed"));
    EXPECT_THAT(ContentOf(File("tickets/SYS_0000.xml")), HasSubstr(">Changed<"));
}

TEST_F(SiteFolder, WhatKilledProcessesLeftOfItsFiles_GoesAtTheNextStart)
{
    MakeSite();
    std::string const suffix = ".0123456789abcdef.tmp";
    for (char const* const name : {"seed.xml", "tickets/SYS_0000.xml", "tickets/own.xml"})
        WriteFile(File(name + suffix), "half");
    MakeSite();
    EXPECT_FALSE(std::filesystem::exists(File("seed.xml" + suffix)));
    EXPECT_FALSE(std::filesystem::exists(File("tickets/SYS_0000.xml" + suffix)));
    EXPECT_TRUE(std::filesystem::exists(File("tickets/own.xml" + suffix))) << "no file of the site's own";
}

TEST_F(SiteFolder, SystemTicketFile_IsATicketFile)
{
    OpenedSite site(Folder(), ShippedSeed);
    site.Put("System/Name", "New name");
    TicketXml const mirror = TicketXml::Read(File("tickets/SYS_0000.xml"));
    EXPECT_EQ(mirror.address, SystemTicket);
    EXPECT_THAT(mirror.Text(), HasSubstr(">New name<"));
}

TEST_F(SiteFolder, SystemTicketFile_ThatCannotBeWritten_IsOneLineOnStderr)
{
    OpenedSite site(Folder(), ShippedSeed);
    std::filesystem::remove_all(File("tickets"));
    testing::internal::CaptureStderr();
    EXPECT_TRUE(site.Put("System/Name", "New name"));
    EXPECT_EQ(testing::internal::GetCapturedStderr(),
              File("tickets").string() + ": cannot be locked: No such file or directory; make the file or "
                                         "folder, or correct its path\n");
}

// Whoever keeps the turn, a program that was stopped for instance, holds up nobody for long.
TEST_F(SiteFolder, SystemTicketFile_WhoseTurnSomebodyKeeps_IsWrittenWhenItIsFree)
{
    OpenedSite site(Folder(), ShippedSeed);
    std::string const before = ContentOf(File("tickets/SYS_0000.xml"));
    testing::internal::CaptureStderr();
    {
        Descriptor const turn(open(File("tickets").c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
        ASSERT_EQ(flock(turn.Number(), LOCK_EX), 0);
        auto const begun = std::chrono::steady_clock::now();
        for (int i = 0; i < 20; ++i)
            EXPECT_TRUE(site.Put("System/Name", "Name " + std::to_string(i)));
        EXPECT_LT(std::chrono::steady_clock::now() - begun, std::chrono::seconds(15));
        EXPECT_EQ(ContentOf(File("tickets/SYS_0000.xml")), before);
    }
    EXPECT_THAT(testing::internal::GetCapturedStderr(), ContainsRegex("^[^\n]*cannot be locked[^\n]*\n$"));
    site.Server().Tidy();
    EXPECT_THAT(ContentOf(File("tickets/SYS_0000.xml")), HasSubstr("Name 19"));
}

TEST_F(SiteFolder, SystemTicketFile_WhoseTurnComes_IsWrittenWhenTheChangeReturns)
{
    OpenedSite site(Folder(), ShippedSeed);
    auto turn =
        std::make_unique<Descriptor>(open(File("tickets").c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    ASSERT_EQ(flock(turn->Number(), LOCK_EX), 0);
    std::thread holder(
        [&]
        {
            std::this_thread::sleep_for(std::chrono::milliseconds(100));
            turn.reset();
        });
    EXPECT_TRUE(site.Put("System/Name", "In turn"));
    EXPECT_THAT(ContentOf(File("tickets/SYS_0000.xml")), HasSubstr("In turn"));
    holder.join();
}

TEST_F(SiteFolder, SystemTicketFile_WrittenWhileThreadsFork_IsNobodysTurnAfterwards)
{
    OpenedSite site(Folder(), ShippedSeed);
    std::atomic<bool> isDone = false;
    std::thread writer(
        [&]
        {
            for (int i = 0; !isDone; ++i)
                site.Put("System/Name", "Name " + std::to_string(i));
        });
    std::vector<pid_t> children;
    for (int i = 0; i < 20; ++i)
    {
        children.push_back(fork());
        while (children.back() == 0)
            pause();
        std::this_thread::sleep_for(std::chrono::milliseconds(2));
    }
    isDone = true;
    writer.join();
    Descriptor const turn(open(File("tickets").c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    EXPECT_EQ(flock(turn.Number(), LOCK_EX | LOCK_NB), 0) << "a child that lives on keeps it";
    for (pid_t const child : children)
    {
        kill(child, SIGKILL);
        waitpid(child, nullptr, 0);
    }
}

// Somebody edits the database with tools of his own, past the journal.
TEST_F(SiteFolder, DatabaseEditedByHand_IsReadAndWrittenAllTheSame)
{
    OpenedSite site(Folder(), ShippedSeed);
    auto const edit = [this](char const* sql)
    {
        sqlite3* database = nullptr;
        ASSERT_EQ(sqlite3_open(File("site.db").c_str(), &database), SQLITE_OK);
        EXPECT_EQ(sqlite3_exec(database, sql, nullptr, nullptr, nullptr), SQLITE_OK);
        sqlite3_close(database);
    };
    auto const pages = [&] { return site.Server().Tickets().Int({3, 1}, "Job/Pages"); };

    edit("UPDATE ticket SET revision = revision + 1000 WHERE type = 3");  // nobody has read it yet
    EXPECT_EQ(pages(), 48);
    edit("UPDATE ticket SET revision = 1 WHERE type = 3");
    EXPECT_TRUE(site.Put({3, 1}, "Job/Pages", TicketValue::Int(50)));
    EXPECT_EQ(pages(), 50);
    edit("UPDATE ticket SET incarnation = incarnation + 1, revision = revision + 1 WHERE type = 3");
    EXPECT_TRUE(site.Put({3, 1}, "Job/Pages", TicketValue::Int(51)));
    edit("DELETE FROM ticket WHERE type = 3 AND id = 1");
    EXPECT_FALSE(site.Put({3, 1}, "Job/Pages", TicketValue::Int(52)));
    EXPECT_EQ(pages(), std::nullopt);
    edit("INSERT INTO ticket VALUES (3, 1, 1, 1, 0)");
    EXPECT_FALSE(site.Server().Create({3, 1}));
    EXPECT_EQ(pages(), 51);  // its values were left behind
}

TEST_F(SiteFolder, SecondProgram_SharesTheSite)
{
    ChildProcess child(
        [this](ChildProcess::Report const& report)
        {
            OpenedSite site(Folder(), ShippedSeed);
            report(1);
            while (site.Server().Tickets().Int(SystemTicket, "Asked").value_or(0) == 0)
                std::this_thread::yield();
            site.Put(SystemTicket, "Answered", TicketValue::Int(7));
            report(2);
            pause();
        });
    ASSERT_TRUE(child.Next());
    {
        OpenedSite site(Folder(), ShippedSeed);
        EXPECT_EQ(site.Store().Programs().size(), 2u);
        EXPECT_TRUE(site.Put(SystemTicket, "Asked", TicketValue::Int(1)));
        ASSERT_EQ(child.Next(), 2);
        EXPECT_EQ(site.Server().Tickets().Int(SystemTicket, "Answered"), 7);
    }
    child.Kill();
    OpenedSite site(Folder(), ShippedSeed);
    EXPECT_EQ(site.Server().Tickets().Int(SystemTicket, "Answered"), 7);
    EXPECT_EQ(site.Store().Programs().size(), 1u) << "the dead one is buried by the opening";
}

// A tool of the owner's may be the first, after a program that died, and stay.
TEST_F(SiteFolder, BehindAProgramThatOnlyLooks_IsPutInOrderAllTheSame)
{
    MakeSite();
    std::filesystem::remove_all(folder / "moved");
    std::filesystem::rename(Folder(), folder / "moved");
    std::filesystem::path const site = folder / "moved";
    std::filesystem::create_directories(site / "job" / "77");  // of a job that nobody knows
    std::filesystem::remove(site / "tickets" / "SYS_0000.xml");
    std::filesystem::remove(site / "site.lock");  // with the note of the orderly end
    SqliteStore looking(site, NoContent);
    OpenedSite opened(site, ShippedSeed);
    EXPECT_EQ(opened.Text(SystemTicket, "System/InstallFolder"), site.string());
    EXPECT_TRUE(std::filesystem::exists(site / "tickets" / "SYS_0000.xml"));
    EXPECT_FALSE(std::filesystem::exists(site / "job" / "77"));
}

TEST_F(SiteFolder, RulesOfTrouble_AreFollowedByWhoeverOpensIt)
{
    {
        OpenedSite site(Folder(), ShippedSeed);
        EXPECT_FALSE(site.Server().Troubles().Any());
        site.Put("System/Trouble", "full");
        EXPECT_TRUE(site.Server().Troubles().IsDiskFull());
    }
    OpenedSite later(Folder(), ShippedSeed);
    EXPECT_TRUE(later.Server().Troubles().IsDiskFull());
    standin::ChangeRules(later.Store(), [](std::vector<std::string>& rules) { rules.clear(); });
    EXPECT_EQ(later.Server().Tickets().Int(SystemTicket, "System/MasterSOAPPort"), 50000);
    EXPECT_FALSE(later.Server().Troubles().Any());
    EXPECT_EQ(later.Text(SystemTicket, "System/Trouble"), "(missing)");
}

TEST_F(SiteFolder, RulesOfTrouble_OfAnotherProgram_AreFollowedAsSoonAsTheyAreHeardOf)
{
    OpenedSite first(Folder(), ShippedSeed);
    OpenedSite second(Folder(), ShippedSeed);
    standin::ChangeRules(first.Store(), [](auto& rules) { rules.assign({"twice", "full"}); });
    EXPECT_EQ(first.Text(SystemTicket, "System/Trouble"), "twice\nfull\n");
    EXPECT_EQ(second.Server().Tickets().Int(SystemTicket, "System/MasterSOAPPort"), 50000);
    EXPECT_TRUE(second.Server().Troubles().IsDiskFull());
}

// As a client may write it that knows no better.
TEST_F(SiteFolder, RulesOfTrouble_InAList_AreTheFirstValueForAll)
{
    {
        OpenedSite site(Folder(), ShippedSeed);
        site.Put("System/Trouble", "full");
        site.Put("System/Trouble", "twice", 1);
        EXPECT_TRUE(site.Server().Troubles().IsDiskFull());
    }
    OpenedSite later(Folder(), ShippedSeed);
    EXPECT_TRUE(later.Server().Troubles().IsDiskFull());
    EXPECT_THAT(standin::RulesOf(later.Store()), testing::ElementsAre("full"));
}

// A client that hangs in its callback keeps nobody from setting rules, and from taking them back.
TEST_F(SiteFolder, RulesOfTrouble_AreFollowedThoughAClientHasNoRoom)
{
    OpenedSite site(Folder(), ShippedSeed);
    standin::Server& server = site.Server();
    auto const session = server.Open({"admin", "", standin::AdministratorRole, 1});
    std::promise<void> hanging;
    std::shared_future<void> const goOn = hanging.get_future().share();
    int const id = server.Notifications().NewId();
    ASSERT_TRUE(server.Notifications().Register(*session, id, [goOn](auto const&) { goOn.wait(); }));
    ASSERT_TRUE(server.Notifications().Enable(*session, id, {3, TICKET_ID_ALL}, standin::KeyFilter(nullptr)));
    ASSERT_TRUE(server.Notifications().Enable(*session, id, SystemTicket, standin::KeyFilter(nullptr)));
    server.Create({3, 1});
    std::string const large(40u << 20, 'x');
    for (int i = 0; i < 4 && server.Notifications().HasRoom(); ++i)
        EXPECT_TRUE(site.Put({3, 1}, "K" + std::to_string(i), TicketValue::String(large)));
    ASSERT_FALSE(server.Notifications().HasRoom());
    standin::ChangeRules(site.Store(), [](auto& rules) { rules.assign({"full"}); });
    server.Tickets().CatchUp();
    EXPECT_TRUE(server.Troubles().IsDiskFull());
    standin::ChangeRules(site.Store(), [](auto& rules) { rules.clear(); });
    server.Tickets().CatchUp();
    EXPECT_FALSE(server.Troubles().IsDiskFull());
    hanging.set_value();
    server.Logout(*session);
}

TEST_F(SiteFolder, OpenedTwiceInOneProcess_IsSharedAsByTwoPrograms)
{
    OpenedSite first(Folder(), ShippedSeed);
    OpenedSite second(Folder(), ShippedSeed);
    EXPECT_TRUE(first.Put(SystemTicket, "K", TicketValue::Int(1)));
    EXPECT_EQ(second.Server().Tickets().Int(SystemTicket, "K"), 1);
    EXPECT_EQ(second.Store().Programs().size(), 2u);
}

TEST_F(SiteFolder, ProgramsThatComeTogether_AllFindOneWholeSite)
{
    constexpr int Programs = 6;
    std::vector<std::unique_ptr<ChildProcess>> children;
    for (int i = 0; i < Programs; ++i)
        children.push_back(std::make_unique<ChildProcess>(
            [this](ChildProcess::Report const& report)
            {
                OpenedSite site(Folder(), ShippedSeed);
                TicketWrite write{"Starts", -2, TicketValue::Int(1)};
                report(site.Server().Write(SystemTicket, {&write, 1}) ? 1 : 0);
            }));
    for (auto const& child : children)
    {
        EXPECT_EQ(child->Wait(), 0);
        EXPECT_EQ(child->Last(-1), 1);
    }
    EXPECT_EQ(Said(), "");
    OpenedSite site(Folder(), ShippedSeed);
    EXPECT_EQ(site.Tickets().size(), Seed::Read(ShippedSeed).tickets.size());
    int starts = 0;
    site.Store().Load(SystemTicket, [&starts](std::string_view key, int, StoredValue const&)
                      { starts += key == "Starts" ? 1 : 0; });
    EXPECT_EQ(starts, Programs);
}

// The first of several programs puts the site in order, which shows by the copy of the system ticket.
TEST_F(SiteFolder, ProgramStartedByTheOwner_DoesNotHoldTheSite)
{
    pid_t helper = -1;
    {
        OpenedSite site(Folder(), ShippedSeed);
        int ends[2];
        ASSERT_EQ(pipe2(ends, O_CLOEXEC), 0);
        helper = fork();
        if (helper == 0)
        {
            execlp("sleep", "sleep", "60", static_cast<char*>(nullptr));
            _exit(1);
        }
        close(ends[1]);
        char none = 0;
        ASSERT_EQ(read(ends[0], &none, 1), 0) << "the pipe closes as the helper starts";
        close(ends[0]);
        EXPECT_FALSE(SqliteStore(Folder(), NoContent).WasFirst()) << "the site is in use";
    }
    EXPECT_TRUE(SqliteStore(Folder(), NoContent).WasFirst());
    EXPECT_EQ(kill(helper, SIGKILL), 0);
    waitpid(helper, nullptr, 0);
}

// What the program prints must not go into a file of the site. SQLite puts /dev/null there.
TEST_F(SiteFolder, OpenedByAProgramWithoutStandardOutput_IsNotWhereThatGoes)
{
    ChildProcess child(
        [&](ChildProcess::Report const& report)
        {
            for (int const standard : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO})
                close(standard);
            OpenedSite const site(Folder(), ShippedSeed);
            for (int const standard : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO})
            {
                struct stat found = {};
                report(fstat(standard, &found) != 0 || S_ISCHR(found.st_mode) ? 1 : 0);
            }
        });
    for (int i = 0; i < 3; ++i)
        EXPECT_EQ(child.Next(), 1) << i;
    EXPECT_EQ(child.Wait(), 0);
}

TEST_F(SiteFolder, EndedInOrder_LeavesTheDatabaseAsOneFile)
{
    MakeSiteNamed("Kept");
    EXPECT_FALSE(std::filesystem::exists(File("site.db-wal")));
    EXPECT_FALSE(std::filesystem::exists(File("site.db-shm")));
    std::filesystem::create_directory(folder / "copy");
    std::filesystem::copy_file(File("site.db"), folder / "copy/site.db");
    EXPECT_EQ(OpenedSite(folder / "copy", ShippedSeed).Text(SystemTicket, "System/Name"), "Kept");
}

TEST_F(SiteFolder, Durability_IsWhatTheEnvironmentSays)
{
    for (char const* const durability : {"full", "normal", ""})
    {
        setenv("COMGUI_DURABILITY", durability, 1);
        EXPECT_EQ(ReasonOfOpening(), "opened") << durability;
    }
    setenv("COMGUI_DURABILITY", "none\n", 1);
    EXPECT_EQ(ReasonOfOpening(),
              "COMGUI_DURABILITY is \"none?\"; it can be normal, which is the default, or full");
    unsetenv("COMGUI_DURABILITY");
}

TEST_F(SiteFolder, DamagedDatabase_IsToldSetAsideAndMadeAnew)
{
    MakeSiteNamed("Lost");
    std::string const broken = ContentOf(File("site.db")).substr(0, 5000);
    WriteFile(File("site.db"), broken);
    std::string const said = Said();
    EXPECT_THAT(said, StartsWith(File("site.db").string() + ": damaged: "));
    ASSERT_FALSE(SetAside().empty());
    EXPECT_THAT(SetAside()[0], ContainsRegex("^site.db.damaged-[0-9]{8}-[0-9]{6}$"));
    EXPECT_THAT(said, HasSubstr(File("site.db").string() + ": set aside as " + SetAside()[0] + "\n"));
    EXPECT_EQ(ContentOf(File(SetAside()[0])), broken);
    EXPECT_EQ(NameOfSite(), "Print Server");
}

TEST_F(SiteFolder, DamagedDatabase_TakesItsJournalWithIt)
{
    MakeSite();
    {
        ChildProcess child(
            [this](ChildProcess::Report const& report)
            {
                OpenedSite site(Folder(), ShippedSeed);
                site.Put("System/Name", "In the journal");
                report(1);
                pause();
            });
        ASSERT_TRUE(child.Next());
    }
    std::string const journal = ContentOf(File("site.db-wal"));
    ASSERT_FALSE(journal.empty());
    WriteFile(File("site.db"), std::string(20000, 'x'));
    EXPECT_NE(Said(), "");
    bool hasJournal = false;
    for (std::string const& name : SetAside())
        hasJournal = hasJournal || (name.ends_with("-wal") && ContentOf(File(name)) == journal);
    EXPECT_TRUE(hasJournal);
    EXPECT_EQ(NameOfSite(), "Print Server");
}

TEST_F(SiteFolder, DamagedAgainAndAgain_NothingIsOverwritten)
{
    for (int round = 0; round < 5; ++round)
    {
        MakeSite();
        WriteFile(File("site.db"), "garbage " + std::to_string(round));
        EXPECT_NE(Said(), "");
    }
    std::set<std::string> contents;
    for (std::string const& name : SetAside())
        if (!name.ends_with("-wal") && !name.ends_with("-shm"))
            contents.insert(ContentOf(File(name)));
    EXPECT_THAT(contents, ElementsAre("garbage 0", "garbage 1", "garbage 2", "garbage 3", "garbage 4"));
}

TEST_F(SiteFolder, NewerDatabase_IsRefusedAndNothingIsTouched)
{
    MakeSite();
    sqlite3* database = nullptr;
    ASSERT_EQ(sqlite3_open(File("site.db").c_str(), &database), SQLITE_OK);
    sqlite3_exec(database, "PRAGMA user_version = 99", nullptr, nullptr, nullptr);
    sqlite3_close(database);
    std::string const before = ContentOf(File("site.db"));
    EXPECT_THAT(ReasonOfOpening(), AllOf(StartsWith(File("site.db").string()), HasSubstr("newer version")));
    EXPECT_EQ(ContentOf(File("site.db")), before);
    EXPECT_THAT(SetAside(), IsEmpty());
}

TEST_F(SiteFolder, DamagedSeed_IsToldSetAsideAndTheShippedOneCopied)
{
    std::filesystem::create_directories(Folder());
    WriteFile(File("seed.xml"), "<site version=\"1\">\n<oops/></site>");
    std::string const said = Said();
    EXPECT_THAT(said, StartsWith(File("seed.xml").string() + ":2: unknown element <oops>\n"));
    ASSERT_EQ(SetAside().size(), 1u);
    EXPECT_THAT(SetAside()[0], StartsWith("seed.xml.damaged-"));
    EXPECT_EQ(ContentOf(File(SetAside()[0])), "<site version=\"1\">\n<oops/></site>");
    EXPECT_EQ(ContentOf(File("seed.xml")), ContentOf(ShippedSeed));
    EXPECT_EQ(NameOfSite(), "Print Server");
}

TEST_F(SiteFolder, DamagedSeedOfAFilledSite_IsNotLookedAt)
{
    MakeSiteNamed("Kept");
    WriteFile(File("seed.xml"), "<oops/>");
    EXPECT_EQ(Said(), "");
    EXPECT_EQ(NameOfSite(), "Kept");
}

TEST_F(SiteFolder, BothSeedsDamaged_SaysSoAndLeavesBoth)
{
    std::filesystem::create_directories(Folder());
    WriteFile(File("seed.xml"), "<oops/>");
    WriteFile(folder / "shipped.xml", "<site version='1'>\n</site>");
    testing::internal::CaptureStderr();
    std::string const reason = ReasonOfOpening(folder / "shipped.xml");
    EXPECT_THAT(testing::internal::GetCapturedStderr(), HasSubstr("seed.xml:1: "));
    EXPECT_THAT(reason,
                AllOf(StartsWith((folder / "shipped.xml").string() + ":1: the system ticket 0/0 is missing"),
                      HasSubstr("; install the program again")));
    EXPECT_EQ(ContentOf(File("seed.xml")), "<oops/>");
    EXPECT_THAT(SetAside(), IsEmpty());
    std::filesystem::remove(File("seed.xml"));
    EXPECT_EQ(NameOfSite(), "Print Server") << "the failed start leaves a site that can be filled";
}

TEST_F(SiteFolder, ShippedSeedMissing_NamesIt)
{
    EXPECT_THAT(ReasonOfOpening(folder / "none.xml"),
                AllOf(StartsWith((folder / "none.xml").string()), HasSubstr("No such file or directory")));
    EXPECT_EQ(NameOfSite(), "Print Server");
}

TEST_F(SiteFolder, FileInPlaceOfTheFolder_IsNamedAndKept)
{
    WriteFile(Folder(), "mine");
    EXPECT_EQ(ReasonOfOpening(), Folder().string() +
                                     ": the folder cannot be made: Not a directory; move away the file "
                                     "that stands where a folder is needed, or choose another folder");
    EXPECT_EQ(ContentOf(Folder()), "mine");
}

TEST_F(SiteFolder, BelowAFile_IsNamed)
{
    WriteFile(Folder(), "mine");
    EXPECT_THAT(ReasonOfOpening(File("below"), ShippedSeed),
                AllOf(StartsWith(File("below").string()), HasSubstr("Not a directory; move away")));
}

TEST_F(SiteFolder, UnwritableFolder_IsNamed)
{
    // The process file system refuses new files to everybody, root included.
    EXPECT_THAT(ReasonOfOpening("/proc/self", ShippedSeed),
                AllOf(StartsWith("/proc/self/site.lock: "), HasSubstr("; ")));
    EXPECT_THAT(ReasonOfOpening("/proc/self/site", ShippedSeed),
                AllOf(StartsWith("/proc/self/site: "), HasSubstr("; ")));
}

TEST_F(SiteFolder, FileInPlaceOfASubFolder_IsNamedAndKept)
{
    std::filesystem::create_directories(Folder());
    WriteFile(File("log"), "mine");
    EXPECT_THAT(ReasonOfOpening(),
                StartsWith(File("log").string() + ": the folder cannot be made: Not a directory"));
    EXPECT_EQ(ContentOf(File("log")), "mine");
    std::filesystem::remove(File("log"));
    EXPECT_EQ(NameOfSite(), "Print Server");
}

TEST_F(SiteFolder, DiskFullAtTheFirstStart_IsToldAndTheNextStartIsWhole)
{
    ChildProcess child(
        [this](ChildProcess::Report const& report)
        {
            std::signal(SIGXFSZ, SIG_IGN);
            rlimit const limit{16ul * 1024, 16ul * 1024};
            setrlimit(RLIMIT_FSIZE, &limit);
            report(ReasonOfOpening().find("free some space") != std::string::npos);
        });
    EXPECT_EQ(child.Wait(), 0);
    EXPECT_EQ(child.Last(-1), 1);
    EXPECT_EQ(Said(), "");
    EXPECT_EQ(NameOfSite(), "Print Server");
}

TEST_F(SiteFolder, KilledAtTheFirstStart_TheNextOneFindsNoHalfSite)
{
    std::size_t const tickets = Seed::Read(ShippedSeed).tickets.size();
    auto const start = std::chrono::steady_clock::now();
    MakeSite();
    auto const whole =
        std::chrono::duration_cast<std::chrono::microseconds>(std::chrono::steady_clock::now() - start);
    std::mt19937_64 random(1234);
    int killed = 0;
    for (int round = 0; killed < (IsSanitized ? 10 : 50); ++round)
    {
        ASSERT_LT(round, 1000) << "too many starts were over before they were killed";
        std::filesystem::remove_all(Folder());
        ChildProcess child(
            [this](ChildProcess::Report const& report)
            {
                OpenedSite site(Folder(), ShippedSeed);
                report(1);
            });
        std::this_thread::sleep_for(whole * static_cast<int>(random() % 128) / 100);
        child.Kill();
        killed += child.Last(0) == 0 ? 1 : 0;

        testing::internal::CaptureStderr();
        OpenedSite site(Folder(), ShippedSeed);
        ASSERT_EQ(testing::internal::GetCapturedStderr(), "") << round;
        ASSERT_THAT(SetAside(), IsEmpty()) << round;
        ASSERT_EQ(site.Tickets().size(), tickets) << round;
        ASSERT_TRUE(site.Store().FindUser("admin") && site.Store().FindUser("operator")) << round;
        ASSERT_EQ(site.Text(SystemTicket, "System/InstallFolder"), Folder().string()) << round;
    }
}

namespace
{
std::string ReasonOfSeed(std::string const& inside)
{
    try
    {
        Seed::Parse("<site version='1'><ticket type='0' id='0'/><ticket type='17' id='1'/>\n" + inside +
                        "</site>",
                    "seed");
    }
    catch (XmlError const& error)
    {
        return error.what();
    }
    return "accepted";
}
}  // namespace

TEST(Seed, ShippedOne_NamesTheFoldersInAnOrderThatResolves)
{
    // Every folder leans on the install folder alone, so a reader that goes down any list finds it known.
    std::map<std::string, std::string> folders;
    for (TicketXml const& ticket : Seed::Read(ShippedSeed).tickets)
        if (ticket.address == SystemTicket)
            ticket.Walk(
                [&folders](std::string_view key, int pos, StoredValue const& value)
                {
                    if (key.starts_with("System/Folders/") || key == "System/InstallFolder" ||
                        key == "System/Linearisation/LAB")
                    {
                        EXPECT_EQ(pos, 0) << key;
                        EXPECT_EQ(value.type, PARAM_STRING) << key;
                        folders[std::string(key)] = value.bytes;
                    }
                });
    EXPECT_EQ(folders.size(), 28u);
    for (auto const& [key, folder] : folders)
        EXPECT_TRUE(key == "System/InstallFolder" ? folder == "/" : folder.starts_with("$(INSTALL)/")) << key;
}

TEST(Seed, ShippedOne_HoldsNoPassword)
{
    for (User const& user : Seed::Read(ShippedSeed).users)
        EXPECT_THAT(user.passwordHash, StartsWith("$y$"));
}

TEST(Seed, Mistakes_AreToldWithTheirLine)
{
    std::string const user = "<user name='a' role='1' ticket='1' hash='$y$x'/>";
    std::map<std::string, std::string> const facts{
        {"<users>" + user + "</users>", "accepted"},
        {"<users>" + user + user + "</users>", "seed:2: the user a stands twice"},
        {"<users><user name='a' role='1' ticket='1'/></users>",
         "seed:2: the attribute hash is missing in <user>"},
        {"<users><user name='a' role='x' ticket='1' hash='$y$x'/></users>",
         "seed:2: role is not a number: x"},
        {"<users><user name='' role='1' ticket='1' hash='$y$x'/></users>", "seed:2: a user without a name"},
        {"<users><user name='a' role='1' ticket='1' hash='secret'/></users>",
         "seed:2: the hash of a is none that crypt(3) makes"},
        {"<users><user name='a' role='1' ticket='1' hash='$y$x' password='x'/></users>",
         "seed:2: unknown attribute password"},
        {"<users><user name='a' role='1' ticket='9' hash='$y$x'/></users>",
         "seed:1: the user a has no ticket 17/9"},
        {"<users><admin/></users>", "seed:2: unknown element <admin>"},
        {"<ticket/>", "seed:2: a ticket of a site needs type and id"},
        {"<ticket type='17' id='1'/>", "seed:2: the ticket 17/1 stands twice"},
        {"<ticket type='3' id='1'>\n<parameter key='K' type='int'>x</parameter></ticket>",
         "seed:3: not a number of type int: x"},
        {"<jobs/>", "seed:2: unknown element <jobs>"},
        {"hello", "seed:1: text where none is expected: hello"},
    };
    for (auto const& [inside, reason] : facts)
        EXPECT_EQ(ReasonOfSeed(inside), reason) << inside;
}
