// Files and jobs on their way: where they may go, what becomes of them when something fails, and who is told.
#include "standin/server/transfer/TransferService.h"

#include "standin/server/jobs/JobIntake.h"
#include "tests/server/ServerTest.h"
#include "tests/support/Files.h"
#include "tests/support/FullDisk.h"
#include <fcntl.h>
#include <fstream>
#include <gmock/gmock.h>
#include <random>
#include <set>
#include <sys/fsuid.h>
#include <sys/stat.h>
#include <thread>

using namespace standin;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
namespace fs = std::filesystem;

namespace
{
TransferResult ResultOf(std::function<void()> const& work)
{
    try
    {
        work();
    }
    catch (TransferError const& error)
    {
        EXPECT_EQ(std::string(error.what()).find('\n'), std::string::npos) << error.what();
        EXPECT_STRNE(error.what(), "");
        return error.Result();
    }
    return Transferred;
}

std::string Shown(ServerPath const& path)
{
    std::string text = path.variable;
    for (std::string const& folder : path.folders)
        text += "|" + folder;
    return text + "|" + path.name;
}

std::string Bytes(std::size_t size)
{
    std::mt19937_64 random(static_cast<unsigned>(size));
    std::string bytes(size, '\0');
    for (char& byte : bytes)
        byte = static_cast<char>(random());
    return bytes;
}

struct PATH_FACT
{
    char const* name;
    std::string text;
    std::string parts;  // empty: refused
};
class ServerPaths : public testing::TestWithParam<PATH_FACT>
{
};
}  // namespace

TEST_P(ServerPaths, AreTakenApartOrRefused)
{
    std::string parts;
    TransferResult const result =
        ResultOf([&] { parts = Shown(ServerPath::Parse(GetParam().text, "leaf.pdf")); });
    EXPECT_EQ(parts, GetParam().parts);
    EXPECT_EQ(result, GetParam().parts.empty() ? PathRefused : Transferred);
}

INSTANTIATE_TEST_SUITE_P(
    Facts, ServerPaths,
    testing::Values(
        PATH_FACT{"File", "$(TEMP)/a.pdf", "TEMP|a.pdf"},
        PATH_FACT{"Below", "$(TEMP)/b/c/a.pdf", "TEMP|b|c|a.pdf"},
        PATH_FACT{"VariableAlone", "$(TEMP)", "TEMP|leaf.pdf"},
        PATH_FACT{"VariableAndSlash", "$(TEMP)/", "TEMP|leaf.pdf"},
        PATH_FACT{"FolderBelow", "$(TEMP)/b/", "TEMP|b|leaf.pdf"},
        PATH_FACT{"Backslashes", "$(TEMP)\\b\\a.pdf", "TEMP|b|a.pdf"},
        PATH_FACT{"Utf8", "$(TEMP)/Gr\xC3\xBCn \xE5\x8D\xB0.pdf", "TEMP|Gr\xC3\xBCn \xE5\x8D\xB0.pdf"},
        PATH_FACT{"Name255", "$(TEMP)/" + std::string(255, 'n'), "TEMP|" + std::string(255, 'n')},
        PATH_FACT{"Hidden", "$(TEMP)/.hidden", "TEMP|.hidden"}, PATH_FACT{"Empty", "", ""},
        PATH_FACT{"NoVariable", "a.pdf", ""}, PATH_FACT{"Absolute", "/etc/passwd", ""},
        PATH_FACT{"EmptyVariable", "$()/a.pdf", ""}, PATH_FACT{"VariableWithoutEnd", "$(TEMP/a.pdf", ""},
        PATH_FACT{"VariableNotAtTheBeginning", "x$(TEMP)/a.pdf", ""},
        PATH_FACT{"NameGluedToTheVariable", "$(TEMP)a.pdf", ""}, PATH_FACT{"Up", "$(TEMP)/../site.db", ""},
        PATH_FACT{"UpAtTheEnd", "$(TEMP)/b/..", ""}, PATH_FACT{"UpByBackslashes", "$(TEMP)\\..\\site.db", ""},
        PATH_FACT{"Here", "$(TEMP)/./a.pdf", ""}, PATH_FACT{"EmptyInTheMiddle", "$(TEMP)//a.pdf", ""},
        PATH_FACT{"Newline", "$(TEMP)/a\nb.pdf", ""}, PATH_FACT{"NewlineInAFolder", "$(TEMP)/a\nb/c.pdf", ""},
        PATH_FACT{"ZeroByte", std::string("$(TEMP)/a\0b", 11), ""}, PATH_FACT{"Delete", "$(TEMP)/a\x7F", ""},
        PATH_FACT{"Name256", "$(TEMP)/" + std::string(256, 'n'), ""},
        PATH_FACT{"Folder300", "$(TEMP)/" + std::string(300, 'n') + "/a", ""},
        PATH_FACT{"NameOfAPartFile", "$(TEMP)/.transfer.0123456789abcdef.tmp", ""}),
    [](auto const& fact) { return std::string(fact.param.name); });

// A server over a store in memory, with its folders in a folder of the test's own.
class Transfers : public ServerTest
{
protected:
    Transfers()
    {
        siteFolder = Site();
        for (char const* const name :
             {"site", "site/temp", "site/job", "site/print", "site/tickets", "client"})
            fs::create_directory(folder / name);
        SetText("System/InstallFolder", Site());
        SetText("System/Folders/Temp", "$(INSTALL)/temp");
        SetText("System/Folders/Print", "$(INSTALL)/print");
        SetText("System/Folders/Job", "$(INSTALL)/job");
    }
    ~Transfers() override { Restart(); }  // ends the threads that use the members below

    void SetText(char const* key, std::string const& text)
    {
        StoredValue value;
        value.type = PARAM_STRING;
        value.bytes = text;
        site->Put(SystemTicket, key, 0, value);
    }
    std::string Site() const { return folder / "site"; }
    fs::path Temp(std::string const& name = {}) const { return folder / ("site/temp/" + name); }
    std::string Client(std::string const& name) const { return folder / ("client/" + name); }
    std::string Write(std::string const& name, std::string const& content) const
    {
        WriteFile(Client(name), content);
        return Client(name);
    }

    TransferResult Put(std::string const& from, std::string const& to)
    {
        return Carry({TransferService::Request::ToServer, from, to});
    }
    TransferResult Get(std::string const& from, std::string const& to)
    {
        return Carry({TransferService::Request::ToClient, from, to});
    }
    TransferResult Carry(TransferService::Request const& request)
    {
        return Said([&] { return Server().Transfers().Carry(As("operator"), request); });
    }
    // A failure is one line, success and a cut say nothing.
    TransferResult Said(std::function<TransferResult()> const& work)
    {
        As("operator");
        testing::internal::CaptureStderr();
        TransferResult const result = work();
        said = testing::internal::GetCapturedStderr();
        bool const isSilent = result == Transferred || result == TransferCut;
        EXPECT_EQ(std::count(said.begin(), said.end(), '\n'), isSilent ? 0 : 1) << said;
        return result;
    }
    void ExpectNothingArrived() const
    {
        EXPECT_THAT(NamesIn(Temp()), IsEmpty());
        EXPECT_THAT(NamesIn(folder / "site/job"), IsEmpty());
    }

    std::string said;
};

using PutFile = Transfers;
using GetFile = Transfers;
using Places = Transfers;

TEST_F(PutFile, EverySizeAroundAPiece_ArrivesByteByByte)
{
    Server().Transfers().Set({4096});
    for (std::size_t const size : {0u, 1u, 4095u, 4096u, 4097u, 3 * 4096u + 7u})
    {
        std::string const content = Bytes(size);
        ASSERT_EQ(Put(Write("a", content), "$(TEMP)/a"), Transferred) << size;
        ASSERT_EQ(ContentOf(Temp("a")), content) << size;
        ASSERT_EQ(Get("$(TEMP)/a", Client("back")), Transferred) << size;
        ASSERT_EQ(ContentOf(Client("back")), content) << size;
    }
    EXPECT_THAT(NamesIn(Temp()), ElementsAre("a"));
    EXPECT_THAT(NamesIn(folder / "client"), ElementsAre("a", "back"));
}

TEST_F(PutFile, FromAnotherFileSystem_ArrivesByteByByte)
{
    fs::path const elsewhere = fs::current_path() / ("transfer-test-" + std::to_string(getpid()));
    std::string const content = Bytes(300001);
    WriteFile(elsewhere, content);
    Server().Transfers().Set({65536});
    EXPECT_EQ(Put(elsewhere, "$(TEMP)/a"), Transferred);
    fs::remove(elsewhere);
    EXPECT_EQ(ContentOf(Temp("a")), content);
}

TEST_F(PutFile, FolderAsTarget_TakesTheSourcesName)
{
    fs::create_directory(Temp("b"));
    std::string const file = Write("a.pdf", "content");
    EXPECT_EQ(Put(file, "$(TEMP)"), Transferred);
    EXPECT_EQ(Put(file, "$(TEMP)/b/"), Transferred);
    EXPECT_EQ(ContentOf(Temp("a.pdf")), "content");
    EXPECT_EQ(ContentOf(Temp("b/a.pdf")), "content");
    EXPECT_EQ(Get("$(TEMP)/a.pdf", Client("") + "sub/"), TargetUnwritable);  // folders are not made
    fs::create_directory(Client("sub"));
    EXPECT_EQ(Get("$(TEMP)/a.pdf", Client("") + "sub/"), Transferred);
    EXPECT_EQ(ContentOf(Client("sub/a.pdf")), "content");
}

TEST_F(PutFile, BackslashesInTheLocalPath_AreSeparators)
{
    Write("a.pdf", "content");
    EXPECT_EQ(Put((folder / "client").string() + "\\a.pdf", "$(TEMP)\\"), Transferred);
    EXPECT_EQ(ContentOf(Temp("a.pdf")), "content");
}

TEST_F(PutFile, FileThatIsThere_IsReplacedAndKeepsItsPermissions)
{
    WriteFile(Temp("a"), "a much longer content than the new one");
    chmod(Temp("a").c_str(), 0640);
    EXPECT_EQ(Put(Write("a", "new"), "$(TEMP)/a"), Transferred);
    EXPECT_EQ(ContentOf(Temp("a")), "new");
    struct stat found = {};
    stat(Temp("a").c_str(), &found);
    EXPECT_EQ(found.st_mode & 07777, 0640u);
}

TEST_F(PutFile, HolesOfTwoGiB_StayHoles)
{
    std::string const file = Write("sparse", "begin");
    fs::resize_file(file, std::uintmax_t{2} << 30);
    EXPECT_EQ(Put(file, "$(TEMP)/sparse"), Transferred);
    EXPECT_EQ(fs::file_size(Temp("sparse")), std::uintmax_t{2} << 30);
    struct stat found = {};
    stat(Temp("sparse").c_str(), &found);
    EXPECT_LT(found.st_blocks, 4096);
    std::ifstream content(Temp("sparse"));
    std::string begin(5, ' ');
    content.read(begin.data(), 5);
    EXPECT_EQ(begin, "begin");
}

TEST_F(PutFile, SourceThatCannotBeRead_IsTold)
{
    EXPECT_EQ(Put(Client("missing"), "$(TEMP)/a"), SourceUnreadable);
    EXPECT_THAT(said, HasSubstr("missing"));
    EXPECT_EQ(Put(Client("no folder/a"), "$(TEMP)/a"), SourceUnreadable);
    fs::create_symlink("loop", Client("loop"));
    EXPECT_EQ(Put(Client("loop"), "$(TEMP)/a"), SourceUnreadable);
    ExpectNothingArrived();
}

TEST_F(PutFile, SourceWithoutTheRightToReadIt_IsTold)
{
    std::string const file = Write("a", "content");
    chmod(file.c_str(), 0);
    if (geteuid() == 0)
        setfsuid(65534);  // an administrator may read everything
    EXPECT_EQ(Put(file, "$(TEMP)/a"), SourceUnreadable);
    setfsuid(geteuid());
    EXPECT_THAT(said, AllOf(HasSubstr("right"), testing::Not(HasSubstr("write"))));
    ExpectNothingArrived();
}

TEST_F(PutFile, SourceThatIsNoRegularFile_IsRefusedAtOnce)
{
    EXPECT_EQ(Put(folder / "client", "$(TEMP)/a"), NotAFile);
    mkfifo(Client("pipe").c_str(), 0600);
    EXPECT_EQ(Put(Client("pipe"), "$(TEMP)/a"), NotAFile);
    EXPECT_EQ(Put("/dev/zero", "$(TEMP)/a"), NotAFile);
    ExpectNothingArrived();
}

TEST_F(PutFile, NamesThatNoFileCanHave_AreRefused)
{
    std::string const file = Write("a", "content");
    EXPECT_EQ(Put(file, "$(TEMP)/" + std::string(300, 'n')), PathRefused);
    EXPECT_EQ(Put(file, "$(TEMP)/a\nb"), PathRefused);
    EXPECT_EQ(Put(Client(std::string(300, 'n')), "$(TEMP)/a"), PathRefused);
    EXPECT_EQ(Put("", "$(TEMP)/a"), PathRefused);
    EXPECT_EQ(Put("", "$(TEMP)"), PathRefused);
    ExpectNothingArrived();
}

TEST_F(PutFile, LinkAsSource_IsFollowed)
{
    fs::create_symlink(Write("a", "content"), Client("link"));
    EXPECT_EQ(Put(Client("link"), "$(TEMP)/a"), Transferred);
    EXPECT_EQ(ContentOf(Temp("a")), "content");
}

TEST_F(PutFile, FullDisk_LeavesTheOldFileAndNothingElse)
{
    WriteFile(Temp("a"), "old");
    std::string const file = Write("a", Bytes(300000));
    TransferResult const result = [&]
    {
        FullDisk const full(100000);
        return Put(file, "$(TEMP)/a");
    }();
    EXPECT_EQ(result, TargetUnwritable);
    EXPECT_THAT(said, HasSubstr("free some space"));
    EXPECT_THAT(NamesIn(Temp()), ElementsAre("a"));
    EXPECT_EQ(ContentOf(Temp("a")), "old");
}

TEST_F(PutFile, SourceThatIsCutMeanwhile_LeavesNothing)
{
    std::string const file = Write("a", Bytes(300000));
    Server().Transfers().Set({65536, [&] { fs::resize_file(file, 70000); }});
    EXPECT_EQ(Put(file, "$(TEMP)/a"), SourceUnreadable);
    EXPECT_THAT(said, HasSubstr("try again"));
    ExpectNothingArrived();
}

// Where nothing has to be read, so that no read ends early.
TEST_F(PutFile, SourceThatIsCutMeanwhileInTheHoleAtItsEnd_LeavesNothing)
{
    std::string const file = Write("a", Bytes(100000));
    fs::resize_file(file, 1'000'000);
    Server().Transfers().Set({65536, [&] { fs::resize_file(file, 999'999); }});
    EXPECT_EQ(Put(file, "$(TEMP)/a"), SourceUnreadable);
    EXPECT_THAT(said, HasSubstr("try again"));
    ExpectNothingArrived();
}

TEST_F(PutFile, SourceThatGrowsMeanwhile_ArrivesAsLongAsItWas)
{
    std::string const content = Bytes(300000);
    std::string const file = Write("a", content);
    Server().Transfers().Set({65536, [&] { std::ofstream(file, std::ios::app) << "more"; }});
    EXPECT_EQ(Put(file, "$(TEMP)/a"), Transferred);
    EXPECT_TRUE(ContentOf(Temp("a")) == content);
}

TEST_F(PutFile, OntoItself_ChangesNothing)
{
    std::string const content = Bytes(300000);
    WriteFile(Temp("a"), content);
    EXPECT_EQ(Put(Temp("a"), "$(TEMP)/a"), Transferred);
    EXPECT_EQ(Get("$(TEMP)/a", Temp("a")), Transferred);
    EXPECT_TRUE(ContentOf(Temp("a")) == content);
    EXPECT_THAT(NamesIn(Temp()), ElementsAre("a"));
}

TEST_F(PutFile, WhileItComes_HasANameThatNobodyCanForesee_AndIsPrivateIfItsTargetIs)
{
    std::string const file = Write("a", "content");
    WriteFile(Temp("private"), "old");
    fs::permissions(Temp("private"), fs::perms::owner_read | fs::perms::owner_write);
    std::set<std::string> parts;
    Server().Transfers().Set({4096, [&]
                              {
                                  for (std::string const& name : NamesIn(Temp()))
                                      if (IsPartFileName(name))
                                      {
                                          parts.insert(name);
                                          EXPECT_EQ(fs::status(Temp(name)).permissions(),
                                                    fs::status(Temp("private")).permissions());
                                      }
                              }});
    ASSERT_EQ(Put(file, "$(TEMP)/private"), Transferred);
    ASSERT_EQ(Put(file, "$(TEMP)/private"), Transferred);
    EXPECT_EQ(parts.size(), 2u);
}

TEST_F(PutFile, ManyToOneTarget_AreWholeAtAnyInstant)
{
    Server().Transfers().Set({4096});
    As("operator");
    std::vector<std::string> const contents{Bytes(30000), Bytes(50001)};
    std::string const files[] = {Write("a", contents[0]), Write("b", contents[1])};
    ASSERT_EQ(Put(files[0], "$(TEMP)/x"), Transferred);
    std::atomic<int> arrived{0};
    std::vector<std::thread> threads;
    for (std::string const& file : files)
        threads.emplace_back(
            [&]
            {
                for (int i = 0; i < 200; ++i)
                    arrived +=
                        Server().Transfers().Carry(*sessions["operator"], {TransferService::Request::ToServer,
                                                                           file, "$(TEMP)/x"}) == Transferred
                            ? 1
                            : 0;
            });
    bool areWhole = true;
    while (arrived < 400 && areWhole)
        areWhole = testing::Value(ContentOf(Temp("x")), testing::AnyOfArray(contents));
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_TRUE(areWhole);
    EXPECT_EQ(arrived, 400);
    EXPECT_THAT(NamesIn(Temp()), ElementsAre("x"));
}

TEST_F(PutFile, NameWithALineEnd_FailsInOneLine)
{
    SetText("System/Folders/Log", folder / "no\nfolder");
    EXPECT_EQ(Put(Write("a", "content"), "$(LOG)/a"), PathRefused);
    EXPECT_THAT(said, HasSubstr("no?folder"));
    EXPECT_EQ(Put(Client("no\nfile"), "$(TEMP)/a"), SourceUnreadable);
    EXPECT_THAT(said, HasSubstr("no?file"));
}

TEST_F(PutFile, GoodOrBad_LeavesNothingOpen)
{
    auto const open = [] { return NamesIn("/proc/self/fd").size(); };
    std::string const file = Write("a", "content");
    fs::create_directory_symlink(folder / "client", Temp("link"));
    Put(file, "$(TEMP)/a");
    auto const before = open();
    for (char const* const target :
         {"$(TEMP)/a", "$(TEMP)/link", "$(TEMP)/link/a", "$(TEMP)/none/a", "$(INSTALL)/temp/a", "$(JOB)/a"})
    {
        Put(file, target);
        Put(Client("missing"), target);
        Put(folder / "client", target);
        Get(target, Client("b"));
        Get(target, Client("none/b"));
    }
    EXPECT_EQ(open(), before);
}

TEST(FileDescriptor, CloseThatFails_IsTold)
{
    Descriptor good(open("/dev/null", O_RDONLY | O_CLOEXEC));
    int const number = good.Number();
    EXPECT_TRUE(good.Close());
    EXPECT_EQ(good.Number(), -1);
    Descriptor bad(number);  // closed already
    EXPECT_FALSE(bad.Close());
}

TEST_F(PutFile, UntilItIsWhole_TheOldFileIsThere)
{
    WriteFile(Temp("a"), "old");
    std::string const file = Write("a", Bytes(300000));
    int pieces = 0;
    Server().Transfers().Set({65536, [&]
                              {
                                  ++pieces;
                                  EXPECT_EQ(ContentOf(Temp("a")), "old");
                              }});
    EXPECT_EQ(Put(file, "$(TEMP)/a"), Transferred);
    EXPECT_GE(pieces, 5);
    EXPECT_EQ(fs::file_size(Temp("a")), 300000u);
}

TEST_F(GetFile, WhatCannotBeRead_IsTold)
{
    EXPECT_EQ(Get("$(TEMP)/missing", Client("a")), SourceUnreadable);
    EXPECT_EQ(Get("$(TEMP)/missing/b", Client("a")), SourceUnreadable);
    fs::create_directory(Temp("b"));
    EXPECT_EQ(Get("$(TEMP)/b", Client("a")), NotAFile);
    EXPECT_EQ(Get("$(TEMP)/", Client("a")), PathRefused);
    EXPECT_THAT(NamesIn(folder / "client"), IsEmpty());
}

TEST_F(GetFile, TargetThatCannotBeWritten_IsTold)
{
    WriteFile(Temp("a"), "content");
    EXPECT_EQ(Get("$(TEMP)/a", Client("no folder/a")), TargetUnwritable);
    EXPECT_EQ(Get("$(TEMP)/a", folder / "client"), NotAFile);
    EXPECT_EQ(Get("$(TEMP)/a", "/dev/null"), NotAFile);
    EXPECT_EQ(Get("$(TEMP)/a", Client(std::string(300, 'n'))), PathRefused);
    EXPECT_THAT(NamesIn(folder / "client"), IsEmpty());
    fs::create_directory(Client("a\nb"));
    EXPECT_EQ(Get("$(TEMP)/a", Client("a\nb")), NotAFile);
    EXPECT_THAT(said, HasSubstr("a?b"));
    EXPECT_TRUE(fs::is_character_file("/dev/null"));
}

TEST_F(GetFile, LinkAsTarget_StaysALink)
{
    WriteFile(Temp("a"), "content");
    Write("real", "old");
    fs::create_symlink("real", Client("link"));
    EXPECT_EQ(Get("$(TEMP)/a", Client("link")), Transferred);
    EXPECT_TRUE(fs::is_symlink(Client("link")));
    EXPECT_EQ(ContentOf(Client("real")), "content");
}

TEST_F(GetFile, WithinTheJobsFolder_IsAllowed)
{
    fs::create_directory(folder / "site/job/7");
    WriteFile(folder / "site/job/7/a", "content");
    EXPECT_EQ(Get("$(JOB)/7/a", Client("a")), Transferred);
}

TEST_F(Places, UnknownVariables_AreRefused)
{
    std::string const file = Write("a", "content");
    for (char const* const target : {"$(NOPE)/a", "$(temp)/a", "$(THUMBNAIL)/a"})
        EXPECT_EQ(Put(file, target), PathRefused) << target;
}

TEST_F(Places, FolderOfTheVariable_MustBeAbsoluteAndThere)
{
    SetText("System/Folders/Thumbnail", "relative");
    SetText("System/Folders/Log", folder / "missing");
    SetText("System/Folders/Export", folder / "client");  // outside the site, as the administrator wants it
    std::string const file = Write("a", "content");
    EXPECT_EQ(Put(file, "$(THUMBNAIL)/a"), PathRefused);
    EXPECT_EQ(Put(file, "$(LOG)/a"), PathRefused);
    EXPECT_EQ(Put(file, "$(EXPORT)/b"), Transferred);
}

TEST_F(Places, FolderOfTheVariable_ThatMayNotBeOpenedIsNoFaultOfThePath)
{
    std::string const file = Write("a", "content");
    chmod(Temp().c_str(), 0);
    if (geteuid() == 0)
        setfsuid(65534);
    TransferService::Request const later{TransferService::Request::ToServer, file, "$(TEMP)/a"};
    EXPECT_EQ(Said([&] { return Server().Transfers().CarryLater(As("operator"), later); }), TargetUnwritable);
    EXPECT_EQ(Get("$(TEMP)/a", Client("b")), SourceUnreadable);
    setfsuid(geteuid());
    chmod(Temp().c_str(), 0700);
    EXPECT_THAT(said, HasSubstr("right"));
}

TEST_F(Places, LinksBelowTheFolder_AreNotFollowed)
{
    std::string const file = Write("a", "content");
    fs::create_directory_symlink(folder / "client", Temp("link"));
    fs::create_symlink(file, Temp("file"));
    EXPECT_EQ(Put(file, "$(TEMP)/link/b"), PathRefused);
    EXPECT_EQ(Put(file, "$(TEMP)/file"), PathRefused);
    EXPECT_EQ(Get("$(TEMP)/link/a", Client("b")), PathRefused);
    EXPECT_EQ(Get("$(TEMP)/file", Client("b")), PathRefused);
    EXPECT_THAT(NamesIn(folder / "client"), ElementsAre("a"));
    EXPECT_TRUE(fs::is_symlink(Temp("file")));
}

TEST_F(Places, SitesOwnFolder_IsRefusedByWhateverWay)
{
    SetText("System/Folders/Log", "$(INSTALL)");
    SetText("System/Folders/Export", folder.Path());
    WriteFile(folder / "site/site.db", "secret");
    std::string const file = Write("a", "content");
    for (char const* const place : {"$(INSTALL)/site.db", "$(LOG)/site.db", "$(EXPORT)/site/site.db",
                                    "$(INSTALL)/temp/a", "$(EXPORT)/site/temp/a"})
    {
        EXPECT_EQ(Put(file, place), PathRefused) << place;
        EXPECT_EQ(Get(place, Client("b")), PathRefused) << place;
    }
    EXPECT_EQ(ContentOf(folder / "site/site.db"), "secret");
    EXPECT_THAT(NamesIn(folder / "client"), ElementsAre("a"));
}

TEST_F(Places, SitesOwnFolder_IsRefusedWhateverTheSystemTicketSaysOfIt)
{
    WriteFile(folder / "site/site.db", "secret");
    SetText("System/InstallFolder", folder / "client");
    SetText("System/Folders/Log", folder / "site");
    std::string const file = Write("a", "content");
    EXPECT_EQ(Put(file, "$(LOG)/site.db"), PathRefused);
    EXPECT_EQ(Get("$(LOG)/site.db", Client("b")), PathRefused);
    EXPECT_EQ(Put(file, "$(INSTALL)/b"), PathRefused);
    EXPECT_EQ(ContentOf(folder / "site/site.db"), "secret");
}

TEST_F(Places, JobsFolder_IsNotWrittenToByWhateverWay)
{
    SetText("System/Folders/Print", "$(INSTALL)/job");
    fs::create_directory(folder / "site/job/7");
    std::string const file = Write("a", "content");
    for (char const* const place : {"$(JOB)/a", "$(JOB)/7/a", "$(PRINT)/7/a"})
        EXPECT_EQ(Put(file, place), PathRefused) << place;
    EXPECT_THAT(NamesIn(folder / "site/job/7"), IsEmpty());
}

// Transfers that are left for later, told to sessions, and cut.
class LaterTransfers : public Transfers
{
protected:
    ~LaterTransfers() override
    {
        Open();
        Restart();
    }

    void Listen(std::string const& user)
    {
        auto& service = Server().Notifications();
        int const id = service.NewId();
        service.Register(As(user), id,
                         [this](Notification const& told)
                         {
                             std::lock_guard const guard(lock);
                             std::string text =
                                 std::to_string(told.kind) + " " + std::to_string(told.ticket.type) + "/" +
                                 std::to_string(told.ticket.id) + " code " + std::to_string(told.code);
                             for (ChangedParameter const& change : told.parameters)
                                 text += std::string(" ") + change.key->CStr();
                             calls.push_back(text);
                             changed.notify_all();
                         });
    }
    std::vector<std::string> Calls(std::size_t count)
    {
        std::unique_lock guard(lock);
        changed.wait_for(guard, std::chrono::minutes(2), [&] { return calls.size() >= count; });
        return calls;
    }
    TransferResult PutLater(std::string const& user, std::string const& from, std::string const& to)
    {
        return Server().Transfers().CarryLater(As(user), {TransferService::Request::ToServer, from, to});
    }

    // Holds every transfer after its first piece. Pieces are of one byte, so that a cut meets one of 100,000
    // that is far from its end.
    void Close()
    {
        Server().Transfers().Set({1, [this]
                                  {
                                      std::unique_lock guard(lock);
                                      ++held;
                                      changed.notify_all();
                                      changed.wait(guard, [this] { return isOpen; });
                                  }});
    }
    void Open()
    {
        std::lock_guard const guard(lock);
        isOpen = true;
        changed.notify_all();
    }
    void LogOutAndOpen()
    {
        Session& session = As("operator");
        std::thread logout([&] { Server().Logout(session); });
        while (!session.Ended())
            std::this_thread::yield();
        Open();
        logout.join();
    }
    void AwaitHeld(int count = 1)
    {
        std::unique_lock guard(lock);
        changed.wait(guard, [&] { return held >= count; });
    }

    std::mutex lock;
    std::condition_variable changed;
    bool isOpen = false;
    int held = 0;
    std::vector<std::string> calls;
    std::string const ended = " Transfer/Source Transfer/Target Transfer/Code Transfer/Size";
};

TEST_F(LaterTransfers, End_IsToldInOrderToWhoAskedAndNobodyElse)
{
    Listen("operator");
    std::string const file = Write("a", "content");
    testing::internal::CaptureStderr();
    EXPECT_EQ(PutLater("guest", file, "$(TEMP)/guest"), Transferred);
    EXPECT_EQ(PutLater("operator", file, "$(TEMP)/a"), Transferred);
    EXPECT_EQ(PutLater("operator", Client("missing"), "$(TEMP)/b"), Transferred);
    EXPECT_THAT(Calls(2), ElementsAre("6 0/0 code 0" + ended, "6 0/0 code 113" + ended));
    EXPECT_THAT(testing::internal::GetCapturedStderr(), HasSubstr("missing"));
    EXPECT_THAT(NamesIn(Temp()), ElementsAre("a", "guest"));
}

TEST_F(LaterTransfers, WrongPaths_AreToldAtOnce)
{
    testing::internal::CaptureStderr();
    EXPECT_EQ(PutLater("operator", "", "$(TEMP)/a"), PathRefused);
    EXPECT_EQ(PutLater("operator", "a", "$(NOPE)/a"), PathRefused);
    EXPECT_EQ(PutLater("operator", "a", "/etc/passwd"), PathRefused);
    EXPECT_EQ(Server().Transfers().CarryLater(As("operator"),
                                              {TransferService::Request::ToClient, "$(TEMP)/", "a"}),
              PathRefused);
    testing::internal::GetCapturedStderr();
}

TEST_F(LaterTransfers, RelativePath_CountsFromWhereTheClientWasWhenItAsked)
{
    Write("a", "content");
    fs::path const before = fs::current_path();
    Listen("operator");
    Close();
    fs::current_path(folder / "client");
    PutLater("operator", "a", "$(TEMP)/first");
    PutLater("operator", "a", "$(TEMP)/second");
    AwaitHeld();
    fs::current_path(before);
    Open();
    Calls(2);
    EXPECT_EQ(ContentOf(Temp("second")), "content");
}

// Changes that wait for a callback go when the client switches them off; a transfer's end that waits does
// not.
TEST_F(LaterTransfers, SwitchingOff_TakesBackWhatWaits_ButNotTheirEnds)
{
    auto& service = Server().Notifications();
    int const id = service.NewId();
    std::atomic<bool> isHeld{false};
    std::atomic<bool> mayGoOn{false};
    std::vector<int> told;
    service.Register(As("operator"), id,
                     [&](Notification const& each)
                     {
                         isHeld = true;
                         while (!mayGoOn)
                             std::this_thread::yield();
                         std::lock_guard const guard(lock);
                         told.push_back(each.kind);
                         changed.notify_all();
                     });
    standin::TicketAddress const job{3, 1};
    ASSERT_TRUE(service.Enable(As("operator"), id, job, KeyFilter(nullptr)));
    Set(job, "K", 1);
    while (!isHeld)
        std::this_thread::yield();
    Set(job, "K", 2);
    PutLater("operator", Write("a", "content"), "$(TEMP)/a");
    PutLater("operator", Write("a", "content"), "$(TEMP)/b");
    while (!fs::exists(Temp("b")))
        std::this_thread::yield();
    std::thread switching([&] { EXPECT_TRUE(service.Disable(As("operator"), id, job)); });
    while (static_cast<ChangeListener&>(service).Wants(job))
        std::this_thread::yield();
    static_cast<ChangeListener&>(service).HasRoom();  // behind the lock under which it withdraws
    mayGoOn = true;
    switching.join();
    std::unique_lock guard(lock);
    changed.wait_for(guard, std::chrono::minutes(2), [&] { return told.size() >= 3; });
    ASSERT_EQ(told.size(), 3u);
    EXPECT_NE(told[0], 6);
    EXPECT_THAT(std::vector(told.begin() + 1, told.end()), ElementsAre(6, 6));
}

TEST_F(LaterTransfers, MoreThanCanWait_AreRefusedUntilSomeAreDone)
{
    constexpr int Most = TransferService::MostWaiting;
    Listen("operator");
    Close();
    std::string const file = Write("a", "c");
    EXPECT_EQ(PutLater("operator", file, "$(TEMP)/a"), Transferred);
    AwaitHeld();  // it runs, and waits no more
    for (int i = 0; i < Most; ++i)
        ASSERT_EQ(PutLater("operator", file, "$(TEMP)/a"), Transferred) << i;
    EXPECT_EQ(PutLater("operator", file, "$(TEMP)/b"), TooManyTransfers);
    EXPECT_EQ(PutLater("guest", file, "$(TEMP)/guest"), Transferred) << "each session has its own";
    Open();
    EXPECT_EQ(Calls(Most + 1).size(), static_cast<std::size_t>(Most) + 1);
    EXPECT_EQ(PutLater("operator", file, "$(TEMP)/b"), Transferred);
    Calls(Most + 2);
    EXPECT_TRUE(fs::exists(Temp("b")));
}

// They wait to be told, and are kept so long.
TEST_F(LaterTransfers, MoreThanWhoseEndsCanWait_AreRefused)
{
    constexpr std::size_t Most = TransferService::MostWaiting;
    auto& service = Server().Notifications();
    std::atomic<bool> mayGoOn{false};
    std::atomic<std::size_t> told{0};
    service.Register(As("operator"), service.NewId(),
                     [&](Notification const&)
                     {
                         while (!mayGoOn)
                             std::this_thread::yield();
                         ++told;
                     });
    std::string const file = Write("a", "c");
    std::size_t left = 0;
    while (left < Most + 10 && PutLater("operator", file, "$(TEMP)/" + std::to_string(left)) == Transferred)
    {
        while (!fs::exists(Temp(std::to_string(left))))
            std::this_thread::yield();
        ++left;
    }
    EXPECT_GE(left, Most);
    EXPECT_LE(left, Most + 2) << "one is being told, one may be on its way";
    mayGoOn = true;
    while (told < left)
        std::this_thread::yield();
    EXPECT_EQ(PutLater("operator", file, "$(TEMP)/later"), Transferred);
    while (told < left + 1)
        std::this_thread::yield();
}

TEST_F(LaterTransfers, Logout_CutsWhatRunsAndTakesBackWhatWaits)
{
    Listen("operator");
    Listen("guest");
    Close();
    std::string const file = Write("a", Bytes(1000000));
    PutLater("operator", file, "$(TEMP)/a");
    PutLater("operator", file, "$(TEMP)/b");
    PutLater("guest", Write("small", "content"), "$(TEMP)/guest");
    AwaitHeld();
    LogOutAndOpen();
    EXPECT_THAT(Calls(1), ElementsAre("6 0/0 code 0" + ended));  // the guest's
    EXPECT_THAT(NamesIn(Temp()), ElementsAre("guest"));
    EXPECT_EQ(PutLater("operator", file, "$(TEMP)/c"), TransferCut);
}

TEST_F(LaterTransfers, Logout_CutsTransfersOfOtherThreadsToo)
{
    Close();
    std::string const file = Write("a", Bytes(1000000));
    As("operator");
    TransferResult result = Transferred;
    std::thread put([&] { result = Put(file, "$(TEMP)/a"); });
    AwaitHeld();
    LogOutAndOpen();
    ExpectNothingArrived();
    put.join();
    EXPECT_EQ(result, TransferCut);
}

// --- how far a transfer is

class TransferProgress : public LaterTransfers
{
protected:
    // "done of size", or "none".
    std::string ProgressOf(std::string const& user)
    {
        auto const progress = Server().Transfers().ProgressOf(As(user));
        return progress ? std::to_string(progress->done) + " of " + std::to_string(progress->size) : "none";
    }

    // A put of the operator's on a thread of its own.
    std::thread Putting(std::string const& name, std::size_t size, TransferResult due = Transferred)
    {
        return std::thread(
            [this, due, &session = As("operator"), from = Write(name, Bytes(size)), to = "$(TEMP)/" + name]
            {
                auto const direction = TransferService::Request::ToServer;
                EXPECT_EQ(Server().Transfers().Carry(session, {direction, from, to}), due);
            });
    }
};

TEST_F(TransferProgress, OfALaterTransfer_IsToldWhileItCopies)
{
    Close();
    EXPECT_EQ(ProgressOf("operator"), "none");
    PutLater("operator", Write("a", Bytes(3000)), "$(TEMP)/a");
    PutLater("operator", Write("b", Bytes(700)), "$(TEMP)/b");
    AwaitHeld();
    EXPECT_EQ(ProgressOf("operator"), "1 of 3000");
    EXPECT_EQ(ProgressOf("guest"), "none");
    Listen("operator");
    Open();
    Calls(2);
    EXPECT_EQ(ProgressOf("operator"), "none");
}

TEST_F(TransferProgress, OfAFetchedFile_CountsTheSameWay)
{
    WriteFile(Temp("a"), Bytes(3000));
    Close();
    As("operator");
    std::thread get([&] { EXPECT_EQ(Get("$(TEMP)/a", Client("a")), Transferred); });
    AwaitHeld();
    EXPECT_EQ(ProgressOf("operator"), "1 of 3000");
    Open();
    get.join();
    EXPECT_EQ(ProgressOf("operator"), "none");
}

TEST_F(TransferProgress, OfSeveral_IsOfTheOneThatBeganFirst)
{
    Close();
    std::thread one = Putting("first", 3000);
    AwaitHeld();
    std::thread two = Putting("second", 700);
    AwaitHeld(2);
    EXPECT_EQ(ProgressOf("operator"), "1 of 3000");
    Open();
    one.join();
    two.join();
}

TEST_F(TransferProgress, OfAJob_CountsItsFile)
{
    Close();
    std::string const file = Write("a", Bytes(3000));
    Session& session = As("operator");
    std::thread send([&] { EXPECT_EQ(Server().Jobs().Send(session, file, "a"), Transferred); });
    AwaitHeld();
    EXPECT_EQ(ProgressOf("operator"), "1 of 3000");
    Open();
    send.join();
    EXPECT_EQ(ProgressOf("operator"), "none");
}

TEST_F(TransferProgress, WhileOneIsCutByALogout_NeitherWaits)
{
    Close();
    std::thread put = Putting("a", 3000, TransferCut);
    AwaitHeld();
    Session& session = As("operator");
    std::thread logout([&] { Server().Logout(session); });
    while (!session.Ended())
        std::this_thread::yield();
    EXPECT_EQ(ProgressOf("operator"), "1 of 3000") << "while the logout waits for it";
    Open();
    logout.join();
    put.join();
    EXPECT_EQ(ProgressOf("operator"), "none");
}

TEST_F(TransferProgress, NeverGoesDown_AndEndsAtTheSize)
{
    std::string const file = Write("a", Bytes(5000));
    std::vector<std::string> told;
    Server().Transfers().Set({1000, [&] { told.push_back(ProgressOf("operator")); }});
    EXPECT_EQ(Put(file, "$(TEMP)/a"), Transferred);
    EXPECT_THAT(told, ElementsAre("1000 of 5000", "2000 of 5000", "3000 of 5000", "4000 of 5000",
                                  "5000 of 5000", "5000 of 5000"));
}

TEST_F(LaterTransfers, Stop_CutsThemAll)
{
    Close();
    std::string const file = Write("a", Bytes(100000));
    PutLater("operator", file, "$(TEMP)/a");
    PutLater("guest", file, "$(TEMP)/b");
    AwaitHeld();
    Server().Transfers().Stop(std::chrono::milliseconds(1));  // does not wait for one that hangs
    Open();
    Server().Transfers().Stop(std::chrono::minutes(1));
    ExpectNothingArrived();
    EXPECT_EQ(PutLater("guest", file, "$(TEMP)/c"), TransferCut);
}
