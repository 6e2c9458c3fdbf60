#include "desk/model/TicketFile.h"

#include "comgui/testing/TemporaryFolder.h"
#include "desk/model/FileContent.h"
#include "desk/model/SavedFile.h"
#include "desk/model/TicketStream.h"
#include "tests/client/Client.h"
#include "tests/desk/FileFacts.h"
#include "tests/support/HexText.h"
#include <filesystem>
#include <gtest/gtest.h>

using comgui::test::TemporaryFolder;

using namespace comgui;
using namespace desk;

namespace
{
class TicketFiles : public testing::Test
{
protected:
    FileResult<TicketOfFile> Import(std::string_view content)
    {
        return ImportTicket(folder.Write("file", content).string());
    }

    TemporaryFolder folder;
};

std::string Stream(std::vector<SnapshotEntry> entries)
{
    return std::get<std::string>(StreamOf(Snapshot(std::move(entries))));
}

std::string Losses(std::vector<SnapshotEntry> const& entries)
{
    constexpr char const* Names[] = {"type", "value", "left out", "added"};
    std::string text;
    auto const losses = LossesOf(Snapshot(entries), Stream(entries));
    for (auto const& [key, kind] : std::get<std::vector<FileLoss>>(losses))
        text += key + " " + Names[static_cast<int>(kind)] + "; ";
    return text;
}

constexpr char const* SmallXml =
    "<ticket version='1' type='3' id='9'><parameter key='a' type='int'>1</parameter></ticket>";
}  // namespace

TEST_F(TicketFiles, AStream_IsKnownByWhatItIs)
{
    auto const read = Import(Stream({{"a", 1}}));
    ASSERT_EQ(TroubleOf(read), std::nullopt);
    EXPECT_EQ(std::get<TicketOfFile>(read).address, std::nullopt);
    EXPECT_EQ(*std::get<TicketOfFile>(read).ticket.Find("a"), Value(1));
}

TEST_F(TicketFiles, Xml_IsKnownByWhatItIs)
{
    for (std::string const ahead : {"", " \r\n\t", "\xEF\xBB\xBF", "\xEF\xBB\xBF\n", "<!-- -->"})
    {
        auto const read = Import(ahead + SmallXml);
        ASSERT_EQ(TroubleOf(read), std::nullopt) << ahead;
        EXPECT_EQ(std::get<TicketOfFile>(read).address, (TicketAddress{3, 9}));
        EXPECT_EQ(*std::get<TicketOfFile>(read).ticket.Find("a"), Value(1));
    }
}

struct OTHER_FACT
{
    char const* name;
    std::string content;
    FileTrouble trouble;
};
class OtherFile : public TicketFiles, public testing::WithParamInterface<OTHER_FACT>
{
};
TEST_P(OtherFile, IsRefused)
{
    auto const read = Import(GetParam().content);
    ASSERT_EQ(TroubleOf(read), GetParam().trouble);
    EXPECT_EQ(FaultOf(read).file, (folder / "file").string());
}
INSTANTIATE_TEST_SUITE_P(
    Facts, OtherFile,
    testing::Values(OTHER_FACT{"Empty", "", FileTrouble::Empty},
                    OTHER_FACT{"Space", " \n", FileTrouble::UnknownForm},
                    OTHER_FACT{"Text", "Job/Copies=3", FileTrouble::UnknownForm},
                    OTHER_FACT{"Picture", "\x89PNG\r\n\x1A\n", FileTrouble::UnknownForm},
                    OTHER_FACT{"Document", "%PDF-1.7", FileTrouble::UnknownForm},
                    OTHER_FACT{"Utf16", std::string("\xFF\xFE<\0t\0", 6), FileTrouble::UnknownForm},
                    OTHER_FACT{"ZeroBytes", std::string(100000, '\0'), FileTrouble::UnknownForm},
                    OTHER_FACT{"WrongSignature", "\x09STICKET_2", FileTrouble::UnknownForm},
                    OTHER_FACT{"CutSignature", "\x09STICKET", FileTrouble::UnknownForm},
                    OTHER_FACT{"Container", "MTICKET_1" + std::string(16, '\0'),
                               FileTrouble::ContainerStream},
                    OTHER_FACT{"OtherXml", "<html/>", FileTrouble::NotATicket},
                    OTHER_FACT{"BrokenStream", "\x09STICKET_1\xE0", FileTrouble::BrokenStream}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST_F(TicketFiles, NoFile_IsRefused)
{
    EXPECT_EQ(TroubleOf(ImportTicket((folder / "absent").string())), FileTrouble::CannotRead);
    EXPECT_FALSE(FaultOf(ImportTicket((folder / "absent").string())).detail.empty());
    EXPECT_EQ(TroubleOf(ImportTicket("")), FileTrouble::CannotRead);
    EXPECT_EQ(TroubleOf(ImportTicket(folder.Path().string())), FileTrouble::NotAFile);
    EXPECT_EQ(TroubleOf(ImportTicket("/dev/zero")), FileTrouble::NotAFile);
}

TEST_F(TicketFiles, AFileOfTwoGigabytes_IsRefusedUnread)
{
    auto const file = folder.Write("large", Stream({{"a", 1}}));
    std::filesystem::resize_file(file, 2ULL << 30);
    EXPECT_EQ(TroubleOf(ImportTicket(file.string())), FileTrouble::TooLarge);
}

TEST_F(TicketFiles, ALineOfXml_IsCountedFromTheFirst)
{
    EXPECT_EQ(FaultOf(Import("\xEF\xBB\xBF\n\n<tickets/>")).line, 3U);
}

TEST_F(TicketFiles, AStreamThatWasSaved_ComesBack)
{
    std::string const file = (folder / "job.stream").string();
    ASSERT_EQ(SaveFile(file, std::get<std::string>(StreamOf(PlainTicket()))), std::nullopt);
    auto const read = ImportTicket(file);
    ASSERT_EQ(TroubleOf(read), std::nullopt);
    EXPECT_TRUE(Difference(PlainTicket(), std::get<TicketOfFile>(read).ticket).empty());
}

TEST(TicketLosses, OfAPlainTicket_AreNone)
{
    auto const losses = LossesOf(PlainTicket(), std::get<std::string>(StreamOf(PlainTicket())));
    EXPECT_TRUE(std::get<std::vector<FileLoss>>(losses).empty());
}

TEST(TicketLosses, OfNumbersInAStream_AreTheirTypes)
{
    EXPECT_EQ(
        Losses(
            {{"a", 3.0}, {"b", 7U}, {"c", 7LL}, {"d", 1ULL << 60}, {"e", comgui::List{{0, 1.0}, {1, 2.0}}}}),
        "a type; b type; c type; d type; e type; ");
}

TEST(TicketLosses, OfValuesThatComeBackAsOthers_AreValues)
{
    constexpr double Infinity = std::numeric_limits<double>::infinity();
    EXPECT_EQ(Losses({{"a", Infinity},
                      {"b", -0.0},
                      {"c", std::string("x\0y", 3)},
                      {"d", 1},
                      {"e", comgui::List{{0, 1}, {1, comgui::List{}}}}}),
              "a value; b value; c value; e value; ");
}

TEST(TicketLosses, OfWhatNoFileHolds_AreKeys)
{
    int here = 0;
    EXPECT_EQ(
        Losses(
            {{"a", Pointer{&here}}, {"b", comgui::List{}}, {"c", 1}, {std::string(LongestKey + 1, 'k'), 1}}),
        "a left out; b left out; " + std::string(LongestKey + 1, 'k') + " left out; ");
}

TEST(TicketLosses, OfWhatOnlyTheFileHas_AreAdded)
{
    auto const losses = LossesOf(Snapshot(), SmallXml);
    ASSERT_EQ(std::get<std::vector<FileLoss>>(losses).size(), 1U);
    EXPECT_EQ(std::get<std::vector<FileLoss>>(losses)[0].kind, LossKind::Added);
}

TEST(TicketLosses, OfAStreamWithoutBytes_IsThatItCannotBeRead)
{
    EXPECT_EQ(TroubleOf(LossesOf(Snapshot(), Stream({}))), FileTrouble::Empty);
}

TEST(TicketLosses, OfKeysThatChangeMeanwhile_AreNone)
{
    Snapshot const before({{"Changed", "1"}, {"Gone", "1"}, {"Steady", Pointer{}}});
    Snapshot const after({{"Changed", "2"}, {"New", "1"}, {"Steady", Pointer{}}});
    std::string const bytes = Stream({{"Changed", "2"}, {"New", "1"}});
    ASSERT_EQ(std::get<std::vector<FileLoss>>(LossesOf(before, bytes)).size(), 4U);
    auto const losses = LossesOf(before, after, bytes);
    ASSERT_EQ(std::get<std::vector<FileLoss>>(losses).size(), 1U);
    EXPECT_EQ(std::get<std::vector<FileLoss>>(losses)[0].key, "Steady");
}

using TicketOfAServer = Client;

TEST_F(TicketOfAServer, AsXml_LosesNothing)
{
    LogIn();
    TicketAddress const ticket = NewTicket();
    std::vector<KeyValue> values{{"A/Path", "$(JOB)/7/page.pdf"}, {"A/Unsigned", 7U}, {"A/Whole", 3.0}};
    Snapshot const plain = PlainTicket();
    for (auto const& [key, value] : plain.Entries())
        if (value != Value(Bytes{}))  // the server takes no bytes without any
            values.push_back({key, value});
    for (Outcome const& outcome : tickets.WriteAll(ticket, values, Paths::AsStored))
        ASSERT_TRUE(outcome) << outcome.GetError().Text();
    Snapshot const stored = *tickets.ReadAll(ticket, Paths::AsStored);
    ASSERT_EQ(stored.Entries().size(), values.size());

    std::string const xml = *tickets.ToXml(ticket);
    auto const losses = LossesOf(stored, xml);
    ASSERT_EQ(TroubleOf(losses), std::nullopt) << FaultOf(losses).detail;
    for (FileLoss const& loss : std::get<std::vector<FileLoss>>(losses))
        ADD_FAILURE() << loss.key;
    EXPECT_EQ(std::get<TicketOfFile>(TicketOfBytes(xml, "ticket.xml")).address, ticket);
}
