// Single tickets of the factory, in memory and out of files: what is their own about their slots, and what
// becomes of the files.
#include "tests/module/LocalTicketUnderTest.h"

#include "comgui/ticket/BIN_STRING.h"
#include "comgui/ticket/TICKET_OP.h"
#include "tests/support/Files.h"
#include "tests/support/FullDisk.h"
#include <climits>
#include <csignal>
#include <gmock/gmock.h>
#include <limits>
#include <sys/stat.h>
#include <thread>

using comgui::test::TemporaryFolder;

using testing::AllOf;
using testing::AnyOf;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

// --- In memory ---------------------------------------------------------------------------------------------

namespace
{
class MemoryTicket : public testing::Test
{
protected:
    TICKET_FACTORY factory;
    TICKET ticket{factory, nullptr};
};

// What a walk came by, one line a value.
struct WALKED
{
    std::vector<std::string> lines;

    static bool Take(void* context, char const* key, PARAM_TYPE type, void const* value, int pos)
    {
        auto& walked = *static_cast<WALKED*>(context);
        std::string const shown = type == PARAM_STRING ? static_cast<char const*>(value)
                                  : type == PARAM_INT  ? std::to_string(*static_cast<int const*>(value))
                                                       : "type " + std::to_string(type);
        walked.lines.push_back(std::string(key) + "[" + std::to_string(pos) + "]=" + shown);
        return true;
    }
};

std::vector<std::string> WalkOver(TICKET const& ticket)
{
    WALKED walked;
    EXPECT_EQ(ticket->SWALKPARAMETERS(ticket.Instance(), WALKED::Take, &walked, "", 8000), 1);
    return walked.lines;
}
}  // namespace

TEST_F(MemoryTicket, ANewOne_IsEmptyAndOnItsOwn)
{
    TICKET const other(factory, nullptr);
    EXPECT_THAT(WalkOver(ticket), IsEmpty());
    EXPECT_NE(ticket.Access(), other.Access());
    EXPECT_TRUE(ticket.Set("K", 7));
    EXPECT_EQ(other.Int("K"), -1);
}

TEST_F(MemoryTicket, ANullInstance_IsRefusedByEverySlot)
{
    int value = 42;
    STICKET_ACCESS const& table = *ticket.Access();
    EXPECT_EQ(table.SGETPARAMETER(nullptr, "K", PARAM_INT, &value, -1), 0);
    EXPECT_EQ(table.SGETMULTIPAR(nullptr, nullptr), 0);
    EXPECT_EQ(table.SWALKPARAMETERS(nullptr, WALKED::Take, nullptr, "", 8000), 0);
    EXPECT_EQ(table.SSETPARAMETER(nullptr, "K", PARAM_INT, &value, -1), 0);
    EXPECT_EQ(table.SSETMULTIPAR(nullptr, nullptr), 0);
    EXPECT_EQ(table.SOPTION(nullptr, STICKET_OP_WHOAMI, &value), 0);
    EXPECT_EQ(value, 42);
}

TEST_F(MemoryTicket, AnActionThatWrites_FindsTheValuesBehindAsTheyAreThen)
{
    for (char const* const key : {"A", "B", "C"})
        for (int pos = 0; pos < 3; ++pos)
            ticket.Set(key, pos, pos);
    struct WRITING
    {
        TICKET& written;
        WALKED walked{};
    } writing{ticket};
    auto const action = [](void* context, char const* key, PARAM_TYPE type, void const* value, int pos)
    {
        auto& [written, walked] = *static_cast<WRITING*>(context);
        WALKED::Take(&walked, key, type, value, pos);
        if (key[0] == 'A' && pos == 0)
        {
            written.Delete("A", 1);
            written.Set("A", 20, 2);
            written.Set("A", 5, 5);
            written.Delete("B");
            written.Set("AA", 1);  // made meanwhile: not walked over
        }
        return true;
    };
    EXPECT_EQ(ticket->SWALKPARAMETERS(ticket.Instance(), action, &writing, "", 8000), 1);
    EXPECT_THAT(writing.walked.lines,
                ElementsAre("A[0]=0", "A[2]=20", "A[5]=5", "C[0]=0", "C[1]=1", "C[2]=2"));
}

TEST_F(MemoryTicket, HasNoTranslatorOfFolderPaths)
{
    void* out = &factory;
    EXPECT_EQ(ticket->SOPTION(ticket.Instance(), STICKET_OP_FOLDER_VARIABLES, &out), 0);
    EXPECT_EQ(out, &factory);
}

// --- Destroying --------------------------------------------------------------------------------------------

TEST(DestroyTicket, ClearsTheCallersPointer)
{
    TICKET_FACTORY const factory;
    STICKET_ACCESS const* ticket = factory.Create(nullptr);
    ASSERT_TRUE(ticket);
    factory.Destroy(ticket);
    EXPECT_EQ(ticket, nullptr);
}

TEST(DestroyTicket, ANullPointerOrAPointerToNull_IsPutUpWith)
{
    TICKET_FACTORY const factory;
    STICKET_ACCESS const* ticket = nullptr;
    factory.Destroy(ticket);
    EXPECT_EQ(ticket, nullptr);
    factory->DestroyTicket(nullptr);
}

TEST(DestroyTicket, AForeignTicket_IsNotTouched)
{
    TICKET_FACTORY const factory;
    STICKET_ACCESS foreign{};
    STICKET_ACCESS const* ticket = &foreign;
    factory.Destroy(ticket);
    EXPECT_EQ(ticket, &foreign);
}

TEST(DestroyTicket, Twice_DoesNothingTheSecondTime)
{
    TICKET_FACTORY const factory;
    STICKET_ACCESS const* ticket = factory.Create(nullptr);
    STICKET_ACCESS const* const stale = ticket;
    STICKET_ACCESS const* copy = ticket;
    factory.Destroy(ticket);
    factory.Destroy(copy);
    EXPECT_EQ(copy, stale);
}

// --- Files: opening ----------------------------------------------------------------------------------------

namespace
{
class TicketFile : public testing::Test
{
protected:
    std::string Path(char const* name = "ticket.xml") const { return folder.Path() / name; }
    std::string Written(std::string const& parameters, char const* name = "ticket.xml") const
    {
        return folder.Write(name, "<ticket version='1' type='3' id='9'>\n" + parameters + "\n</ticket>\n");
    }
    // What it writes to stderr to open that path, which must fail.
    std::string LineOfFailedOpening(std::string const& path) const
    {
        testing::internal::CaptureStderr();
        EXPECT_EQ(factory.Create(path.c_str()), nullptr);
        return testing::internal::GetCapturedStderr();
    }

    TemporaryFolder folder;
    TICKET_FACTORY factory;
};

MATCHER(IsOneLine, "is one line")
{
    return std::count(arg.begin(), arg.end(), '\n') == 1 && arg.back() == '\n';
}
}  // namespace

TEST_F(TicketFile, Opened_AnswersWithWhatStandsInIt)
{
    TICKET const ticket(factory, Written("<parameter key='I' type='int'>7</parameter>"
                                         "<parameter key='S' type='string'><value pos='0'>a</value>"
                                         "<value pos='2' type='int'>3</value></parameter>"));
    EXPECT_THAT(WalkOver(ticket), ElementsAre("I[0]=7", "S[0]=a", "S[2]=3"));
    unsigned long count = 0;
    EXPECT_TRUE(ticket.Get("S", PARAM_COUNT, &count));
    EXPECT_EQ(count, 3u);
}

TEST_F(TicketFile, ThatIsMissing_GivesNullWithoutAWordAndIsNotMade)
{
    folder.Write("file", "");
    EXPECT_THAT(LineOfFailedOpening(Path("missing.xml")), IsEmpty());
    EXPECT_THAT(LineOfFailedOpening(Path("no folder/ticket.xml")), IsEmpty());
    EXPECT_THAT(LineOfFailedOpening(Path("file/ticket.xml")), IsEmpty());
    EXPECT_THAT(LineOfFailedOpening(""), IsEmpty());
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre("file"));
}

TEST_F(TicketFile, WithBackslashesInItsPath_IsFound)
{
    folder.Write("tickets/SYS_0000.xml", EmptyTicket);
    TICKET const ticket(factory, folder.Path().string() + "\\tickets\\SYS_0000.xml");
    EXPECT_NE(ticket.Access(), nullptr);
}

TEST_F(TicketFile, WithABackslashInItsName_IsNotFound_ByDesign)
{
    EXPECT_THAT(LineOfFailedOpening(folder.Write("a\\b.xml", EmptyTicket)), IsEmpty());
}

TEST_F(TicketFile, OfTheWrongKind_GivesNullAndOneLineWithNameLineAndReason)
{
    struct FACT
    {
        std::string text;
        char const* reason;
    };
    FACT const facts[] = {
        {"", ":1: "},
        {"no XML", ":1: text where none is expected"},
        {"<site version='1'/>", ":1: <ticket> expected, not <site>"},
        {"<ticket version='2'/>", ":1: version 1 expected"},
        {"<ticket version='1'>\n<parameter key='K' type='int'>7</par", ":2: "},
        {"<ticket version='1'>\n<parameter key='K' type='float'>7</parameter></ticket>",
         ":2: unknown type float"},
        {"<ticket version='1'>\n\n<parameter key='K' type='int' x='1'>7</parameter></ticket>",
         ":3: unknown attribute x"},
        {"<ticket version='1'>\n<value/></ticket>", ":2: unknown element <value>"},
        {"<ticket version='1'>\n<parameter key='K' type='int'>7</parameter>\n"
         "<parameter key='K' type='int'>7</parameter></ticket>",
         ":3: the key K stands twice"},
        {"<ticket version='1'>\n<parameter key='K' type='int'><value pos='1'>7</value><value "
         "pos='1'>7</value>"
         "</parameter></ticket>",
         ":2: position 1 stands twice"},
        {"<ticket version='1'>\n<parameter key='K' type='int'>99999999999</parameter></ticket>",
         ":2: out of range of type int"},
        {std::string("<ticket version='1'>\n\x00\xFF</ticket>", 32), ":2: not UTF-8"},
    };
    for (FACT const& fact : facts)
    {
        std::string const path = folder.Write("ticket.xml", fact.text);
        EXPECT_THAT(LineOfFailedOpening(path),
                    AllOf(IsOneLine(), HasSubstr(path + fact.reason), HasSubstr("; correct the file")))
            << fact.text;
        EXPECT_EQ(ContentOf(path), fact.text);
    }
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre("ticket.xml"));
}

TEST_F(TicketFile, ThatIsHuge_IsRefusedAtTheCap)
{
    std::string const path = folder.Write("ticket.xml", EmptyTicket);
    std::filesystem::resize_file(path, std::uintmax_t{3} << 30);
    EXPECT_THAT(LineOfFailedOpening(path), AllOf(IsOneLine(), HasSubstr("larger than 64 MiB")));
}

TEST_F(TicketFile, ThatIsNoRegularFile_IsRefusedWithoutWaiting)
{
    ASSERT_EQ(mkfifo(Path("pipe").c_str(), 0600), 0);
    for (std::string const& path : {Path("pipe"), folder.Path().string(), std::string("/dev/zero")})
        EXPECT_THAT(LineOfFailedOpening(path),
                    AllOf(IsOneLine(), HasSubstr(path), HasSubstr("no regular file")));
}

TEST_F(TicketFile, BehindALinkToItself_IsOneLine)
{
    std::filesystem::create_symlink("ticket.xml", Path());
    EXPECT_THAT(LineOfFailedOpening(Path()), AllOf(IsOneLine(), HasSubstr(Path() + ": cannot be read")));
}

// --- Files: saving -----------------------------------------------------------------------------------------

TEST_F(TicketFile, AChange_IsInTheFileOnceTheTicketIsDestroyed)
{
    std::string const path = Written("<parameter key='Old' type='int'>1</parameter>");
    {
        TICKET const ticket(factory, path);
        EXPECT_TRUE(ticket.Set("New", "text"));
        EXPECT_THAT(ContentOf(path), testing::Not(HasSubstr("New")));
    }
    EXPECT_THAT(WalkOver(TICKET(factory, path)), ElementsAre("New[0]=text", "Old[0]=1"));
    EXPECT_THAT(ContentOf(path), HasSubstr("type=\"3\" id=\"9\""));
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre("ticket.xml"));
}

TEST_F(TicketFile, AChangeBeforeADeletionOfWhatIsNotThere_IsInTheFile)
{
    std::string const path = Written("<parameter key='Old' type='int'>1</parameter>");
    {
        TICKET const ticket(factory, path);
        EXPECT_TRUE(ticket.Set("New", "text"));
        EXPECT_TRUE(ticket.Delete("missing"));
    }
    EXPECT_THAT(WalkOver(TICKET(factory, path)), ElementsAre("New[0]=text", "Old[0]=1"));
}

TEST_F(TicketFile, WithoutAChange_IsLeftAsItWas)
{
    std::string const path = Written("<!-- by hand --><parameter key='K' type='int'>1</parameter>");
    std::string const before = ContentOf(path);
    struct stat then = {};
    ASSERT_EQ(stat(path.c_str(), &then), 0);
    {
        TICKET const ticket(factory, path);
        EXPECT_EQ(ticket.Int("K"), 1);
        EXPECT_TRUE(ticket.Delete("Missing"));
        EXPECT_TRUE(ticket.Delete("K", 5));
        EXPECT_FALSE(ticket.Set("", 1));
        EXPECT_FALSE(ticket.Set("K", 1, -3));
        EXPECT_FALSE(ticket.Set("K", PARAM_COUNT, &path));
    }
    struct stat now = {};
    ASSERT_EQ(stat(path.c_str(), &now), 0);
    EXPECT_EQ(now.st_ino, then.st_ino);  // not even written anew with the same content
    EXPECT_EQ(ContentOf(path), before);
}

TEST_F(TicketFile, EveryTypeButThePointer_ComesBackBitForBit)
{
    std::string const path = Written("");
    int const i = INT_MIN;
    double const denormal = std::numeric_limits<double>::denorm_min();
    double const infinity = -std::numeric_limits<double>::infinity();
    long long const l = LLONG_MIN;
    unsigned const u = UINT_MAX;
    unsigned long long const ul = ULLONG_MAX;
    BIN_STRING const b("a\0b", 3);
    {
        TICKET const ticket(factory, path);
        EXPECT_TRUE(ticket.Set("P", PARAM_POINTER, &i));
        EXPECT_TRUE(ticket.Set("I", PARAM_INT, &i));
        EXPECT_TRUE(ticket.Set("D", PARAM_DOUBLE, &denormal));
        EXPECT_TRUE(ticket.Set("D", PARAM_DOUBLE, &infinity, 1));
        EXPECT_TRUE(ticket.Set("S", " white <space> & \x01\xFF "));
        EXPECT_TRUE(ticket.Set("S", "", 3));
        EXPECT_TRUE(ticket.Set("B", PARAM_BINSTRING, &b));
        EXPECT_TRUE(ticket.Set("L", PARAM_INT64, &l));
        EXPECT_TRUE(ticket.Set("U", PARAM_UNSIGNED, &u));
        EXPECT_TRUE(ticket.Set("UL", PARAM_UNSIGNED64, &ul));
    }
    TICKET const ticket(factory, path);
    void* pointer = nullptr;
    double number = 1;
    BIN_STRING binary;
    long long wide = 0;
    unsigned plain = 0;
    unsigned long long widest = 0;
    EXPECT_FALSE(ticket.Get("P", PARAM_POINTER, &pointer));
    EXPECT_EQ(ticket.Int("I"), INT_MIN);
    EXPECT_TRUE(ticket.Get("D", PARAM_DOUBLE, &number, 0) && number == denormal);
    EXPECT_TRUE(ticket.Get("D", PARAM_DOUBLE, &number, 1) && number == infinity);
    EXPECT_EQ(ticket.Text("S", 0), " white <space> & \x01\xFF ");
    EXPECT_EQ(ticket.Text("S", 2), "none");
    EXPECT_EQ(ticket.Text("S", 3), "");
    ASSERT_TRUE(ticket.Get("B", PARAM_BINSTRING, &binary));
    EXPECT_EQ(std::string(static_cast<char const*>(binary.data), binary.size), std::string("a\0b", 3));
    EXPECT_TRUE(ticket.Get("L", PARAM_INT64, &wide) && wide == LLONG_MIN);
    EXPECT_TRUE(ticket.Get("U", PARAM_UNSIGNED, &plain) && plain == UINT_MAX);
    EXPECT_TRUE(ticket.Get("UL", PARAM_UNSIGNED64, &widest) && widest == ULLONG_MAX);
}

TEST_F(TicketFile, OpenedByARelativePath_IsSavedWhereItWasThoughTheFolderChanged)
{
    std::string const path = Written("");
    auto const start = std::filesystem::current_path();
    std::filesystem::current_path(folder.Path());
    {
        TICKET const ticket(factory, "ticket.xml");
        std::filesystem::current_path("/");
        EXPECT_TRUE(ticket.Set("K", 7));
    }
    std::filesystem::current_path(start);
    EXPECT_EQ(TICKET(factory, path).Int("K"), 7);
}

TEST_F(TicketFile, OpenedTwice_IsWhatTheLastOneSaved)
{
    std::string const path = Written("");
    {
        TICKET const last(factory, path);
        TICKET const first(factory, path);
        EXPECT_TRUE(last.Set("Last", 1));
        EXPECT_TRUE(first.Set("First", 1));
        EXPECT_EQ(last.Int("First"), -1);
    }
    EXPECT_THAT(WalkOver(TICKET(factory, path)), ElementsAre("Last[0]=1"));
}

TEST_F(TicketFile, ThatCannotBeWritten_IsOneLineAndStaysAsItWas)
{
    std::string const path = Written("");
    std::string const before = ContentOf(path);
    STICKET_ACCESS const* ticket = factory.Create(path.c_str());
    ASSERT_TRUE(ticket);
    std::string const text(10000, 'x');
    ASSERT_TRUE(ticket->SSETPARAMETER(ticket->Instance, "K", PARAM_STRING, text.c_str(), -1));

    testing::internal::CaptureStderr();
    {
        FullDisk const full(4096);
        factory.Destroy(ticket);
    }
    EXPECT_THAT(testing::internal::GetCapturedStderr(),
                AllOf(IsOneLine(), HasSubstr(path + ": cannot be written"), HasSubstr("; free some space")));
    EXPECT_EQ(ticket, nullptr);
    EXPECT_EQ(ContentOf(path), before);
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre("ticket.xml"));
}

TEST_F(TicketFile, ThatWouldGrowPastTheCap_IsNotWrittenSinceItCouldNotBeReadAgain)
{
    std::string const path = Written("");
    std::string const before = ContentOf(path);
    STICKET_ACCESS const* ticket = factory.Create(path.c_str());
    ASSERT_TRUE(ticket);
    std::string const text((std::size_t{64} << 20) - 20, 'x');
    ASSERT_TRUE(ticket->SSETPARAMETER(ticket->Instance, "K", PARAM_STRING, text.c_str(), -1));
    testing::internal::CaptureStderr();
    factory.Destroy(ticket);
    EXPECT_THAT(testing::internal::GetCapturedStderr(),
                AllOf(IsOneLine(), HasSubstr(path), HasSubstr("more than 64 MiB; delete values")));
    EXPECT_EQ(ContentOf(path), before);
}

TEST_F(TicketFile, InAFolderThatIsGone_IsOneLine)
{
    std::string const path = folder.Write("sub/ticket.xml", EmptyTicket);
    STICKET_ACCESS const* ticket = factory.Create(path.c_str());
    ASSERT_TRUE(ticket);
    int const value = 7;
    ASSERT_TRUE(ticket->SSETPARAMETER(ticket->Instance, "K", PARAM_INT, &value, -1));
    std::filesystem::remove_all(folder.Path() / "sub");
    testing::internal::CaptureStderr();
    factory.Destroy(ticket);
    EXPECT_THAT(testing::internal::GetCapturedStderr(), AllOf(IsOneLine(), HasSubstr(path)));
    EXPECT_EQ(ticket, nullptr);
}

TEST_F(TicketFile, OfManyThreadsAtOnce_IsWholeAndOneOfTheirs)
{
    std::string const path = Written("");
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i)
        threads.emplace_back(
            [&, i]
            {
                for (int step = 0; step < 25; ++step)
                {
                    TICKET const ticket(factory, path);
                    ASSERT_NE(ticket.Access(), nullptr);
                    EXPECT_EQ(ticket.Int("A"), ticket.Int("B"));
                    SETMULTIPAR table[] = {
                        {"A", PARAM_INT, 0, &i, -1, false, {}}, {"B", PARAM_INT, 0, &i, -1, false, {}}, {}};
                    EXPECT_EQ(ticket->SSETMULTIPAR(ticket.Instance(), table), 1);
                }
            });
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_THAT(WalkOver(TICKET(factory, path)),
                AnyOf(ElementsAre("A[0]=0", "B[0]=0"), ElementsAre("A[0]=1", "B[0]=1"),
                      ElementsAre("A[0]=2", "B[0]=2"), ElementsAre("A[0]=3", "B[0]=3")));
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre("ticket.xml"));
}
