// Streams that come from tickets and go to tickets and files.
#include "comgui/stream/STICKET_BINSTREAM.h"
#include "comgui/testing/TemporaryFolder.h"
#include "tests/stream/WalkedTicket.h"
#include "tests/support/Files.h"
#include "tests/support/HexText.h"
#include "tests/support/StreamOracle.h"
#include <gmock/gmock.h>
#include <gtest/gtest.h>

using comgui::test::CALL;
using comgui::test::SLOT;
using comgui::test::TemporaryFolder;
using comgui::test::TicketFake;

using namespace StreamOracle;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
std::vector<RECORD> const Sample = {Int("Job/Copies", 3), Text("Job/Name", "A4"), Int("Job/Tray", 300, 0),
                                    Int("Job/Tray", -1, 1)};
std::vector<RECORD> const Failing = {Int("a", 1), Int("b", 2, -3), Int("c", 3)};

RECORD Pointer()
{
    RECORD pointer = Int("p", 0);
    pointer.type = PARAM_POINTER;
    return pointer;
}

bool ReadInto(STICKET_ACCESS const* ticket, std::string const& stream, bool fixPositions = true)
{
    ExactBytes const bytes(stream);
    return STICKET_BINSTREAM::Read(ticket, bytes.Data(), bytes.Size(), fixPositions);
}
}  // namespace

// A ticket into memory.

TEST(WriteTicket, WholeTicket_IsWalkedOnce)
{
    WalkedTicket ticket(Sample);
    std::string out = "before";
    unsigned long const size = STICKET_BINSTREAM::Write(out, ticket.Access(), 100);
    EXPECT_EQ(HexOf(out), HexOf(Encode(Sample).value()));
    EXPECT_EQ(size, out.size());
    EXPECT_THAT(ticket.prefixes, ElementsAre(""));
    EXPECT_THAT(ticket.limits, ElementsAre(8000));
}

TEST(WriteTicket, RecordsThatNoStreamCanHold_ArePassedOver)
{
    RECORD count = Int("n", 0);
    count.type = PARAM_COUNT;
    WalkedTicket ticket({Int("a", 1), Pointer(), count, Int("b", 2)});
    std::string out;
    STICKET_BINSTREAM::Write(out, ticket.Access(), 0);
    EXPECT_EQ(ticket.delivered, 4);
    EXPECT_EQ(HexOf(out), HexOf(Encode({Int("a", 1), Int("b", 2)}).value()));
}

TEST(WriteTicket, Empty_GivesNoBytes)
{
    WalkedTicket ticket({});
    std::string out = "before";
    EXPECT_EQ(STICKET_BINSTREAM::Write(out, ticket.Access(), 0), 0u);
    EXPECT_EQ(out, "");
}

TEST(WriteTicket, Failure_EndsTheWalkAndLeavesOutAsItWas)
{
    WalkedTicket ticket(Failing);
    std::string out = "before";
    EXPECT_EQ(STICKET_BINSTREAM::Write(out, ticket.Access(), 0), 6u);
    EXPECT_EQ(out, "before");
    EXPECT_EQ(ticket.delivered, 2);
}

TEST(ExportAction, GoesOnUntilTheWriterFails)
{
    STICKET_BINSTREAM::WRITE writer(0);
    int const value = 5;
    EXPECT_TRUE(STICKET_BINSTREAM::ExportAction(&writer, "k", PARAM_INT, &value, -1));
    EXPECT_TRUE(STICKET_BINSTREAM::ExportAction(&writer, "k", PARAM_POINTER, &value, -1));
    EXPECT_FALSE(STICKET_BINSTREAM::ExportAction(&writer, "k", PARAM_INT, &value, -3));
    EXPECT_FALSE(STICKET_BINSTREAM::ExportAction(&writer, "k", PARAM_INT, &value, -1));
    EXPECT_TRUE(writer.Failed());
}

// A table into memory.

TEST(WriteTable, EmptyTable_GivesNoBytes)
{
    TABLE table({});
    std::string out = "before";
    EXPECT_EQ(STICKET_BINSTREAM::Write(out, table.Records(), 0), 0u);
    EXPECT_EQ(out, "");
}

TEST(WriteTable, NullTable_GivesNoBytes)
{
    std::string out = "before";
    EXPECT_EQ(STICKET_BINSTREAM::Write(out, static_cast<SETMULTIPAR*>(nullptr), 0), 0u);
    EXPECT_EQ(out, "");
}

TEST(WriteTable, ExpectedSize_DoesNotShowInTheStream)
{
    for (unsigned long const reserve : {1ul, 62ul, 100000ul})
    {
        TABLE table(Sample);
        std::string out;
        EXPECT_EQ(STICKET_BINSTREAM::Write(out, table.Records(), reserve), Encode(Sample)->size());
        EXPECT_EQ(HexOf(out), HexOf(Encode(Sample).value()));
    }
}

TEST(WriteTable, ExpectedSizePastAllMemory_IsNoFailure)
{
    TABLE table(Sample);
    std::string out;
    EXPECT_EQ(STICKET_BINSTREAM::Write(out, table.Records(), ~0ul), Encode(Sample)->size());
    EXPECT_EQ(HexOf(out), HexOf(Encode(Sample).value()));
}

// Into files.

class StreamFile : public testing::Test
{
protected:
    std::string Path(char const* name) const { return (folder.Path() / name).string(); }

    TemporaryFolder folder;
};

TEST_F(StreamFile, Table_IsWritten)
{
    TABLE table(Sample);
    EXPECT_TRUE(STICKET_BINSTREAM::Write(Path("stream").c_str(), table.Records(), 0));
    EXPECT_EQ(HexOf(ContentOf(Path("stream"))), HexOf(Encode(Sample).value()));
}

TEST_F(StreamFile, Ticket_IsWritten)
{
    WalkedTicket ticket(Sample);
    EXPECT_TRUE(STICKET_BINSTREAM::Write(Path("stream").c_str(), ticket.Access(), 0));
    EXPECT_EQ(HexOf(ContentOf(Path("stream"))), HexOf(Encode(Sample).value()));
    EXPECT_THAT(ticket.prefixes, ElementsAre(""));
    EXPECT_THAT(ticket.limits, ElementsAre(8000));
}

TEST_F(StreamFile, NameInUtf8_IsTaken)
{
    TABLE table(Sample);
    EXPECT_TRUE(STICKET_BINSTREAM::Write(Path("\xC3\xA4\xE2\x82\xAC").c_str(), table.Records(), 0));
    EXPECT_EQ(ContentOf(Path("\xC3\xA4\xE2\x82\xAC")), Encode(Sample));
}

TEST_F(StreamFile, OlderFile_IsReplaced)
{
    folder.Write("stream", std::string(1000, 'x'));
    TABLE table(Sample);
    EXPECT_TRUE(STICKET_BINSTREAM::Write(Path("stream").c_str(), table.Records(), 0));
    EXPECT_EQ(HexOf(ContentOf(Path("stream"))), HexOf(Encode(Sample).value()));
}

TEST_F(StreamFile, NothingToWrite_LeavesAnEmptyFile)
{
    folder.Write("table", "before");
    TABLE table({Pointer()});
    EXPECT_TRUE(STICKET_BINSTREAM::Write(Path("table").c_str(), table.Records(), 0));
    EXPECT_EQ(ContentOf(Path("table")), "");

    WalkedTicket ticket({});
    EXPECT_TRUE(STICKET_BINSTREAM::Write(Path("ticket").c_str(), ticket.Access(), 0));
    EXPECT_EQ(ContentOf(Path("ticket")), "");
}

TEST_F(StreamFile, Failure_DoesNotTouchTheFile)
{
    folder.Write("stream", "before");
    TABLE table(Failing);
    EXPECT_FALSE(STICKET_BINSTREAM::Write(Path("stream").c_str(), table.Records(), 0));
    WalkedTicket ticket(Failing);
    EXPECT_FALSE(STICKET_BINSTREAM::Write(Path("stream").c_str(), ticket.Access(), 0));
    EXPECT_EQ(ContentOf(Path("stream")), "before");
    EXPECT_FALSE(STICKET_BINSTREAM::Write(Path("new").c_str(), table.Records(), 0));
    EXPECT_FALSE(std::filesystem::exists(Path("new")));
}

TEST_F(StreamFile, FolderThatIsNotThere_IsAFailure)
{
    TABLE table(Sample);
    WalkedTicket ticket(Sample);
    EXPECT_FALSE(STICKET_BINSTREAM::Write(Path("none/stream").c_str(), table.Records(), 0));
    EXPECT_FALSE(STICKET_BINSTREAM::Write(Path("none/stream").c_str(), ticket.Access(), 0));
    EXPECT_TRUE(table.Records()->ok);  // each record was written; it is the file that failed
}

TEST_F(StreamFile, NameOfAFolder_IsAFailure)
{
    TABLE table(Sample);
    EXPECT_FALSE(STICKET_BINSTREAM::Write(folder.Path().c_str(), table.Records(), 0));
}

TEST_F(StreamFile, DeviceThatTakesNothing_IsAFailureOnceItIsLargerThanABuffer)
{
    if (!std::filesystem::exists("/dev/full"))
        GTEST_SKIP() << "no such device";
    STICKET_BINSTREAM::WRITE writer(0);
    std::string const text(1000000, 'x');
    writer.SetParameter("k", PARAM_STRING, text.c_str(), -1);
    EXPECT_FALSE(writer.ToFile("/dev/full"));
    EXPECT_FALSE(writer.Failed());
    EXPECT_TRUE(STICKET_BINSTREAM::WRITE(0).ToFile("/dev/full"));
}

TEST_F(StreamFile, ToFile_LeavesTheWriterAsItWas)
{
    STICKET_BINSTREAM::WRITE writer(0);
    int const value = 1;
    writer.SetParameter("k", PARAM_INT, &value, -1);
    EXPECT_TRUE(writer.ToFile(Path("stream").c_str()));
    std::string bytes;
    writer.Swap(bytes);
    EXPECT_EQ(HexOf(bytes), HexOf(ContentOf(Path("stream"))));
}

// Bytes into a ticket.

TEST(ReadTicket, Stream_IsOneCallOfOneTable)
{
    TicketFake ticket;
    EXPECT_TRUE(ReadInto(ticket.Access(), Encode(Sample).value()));
    EXPECT_THAT(ticket.container.calls,
                ElementsAre(CALL{SLOT::SETTABLE, 0, 0}, CALL{SLOT::SET, 0, 0, "Job/Copies", PARAM_INT, -1},
                            CALL{SLOT::SET, 0, 0, "Job/Name", PARAM_STRING, -1},
                            CALL{SLOT::SET, 0, 0, "Job/Tray", PARAM_INT, -1},
                            CALL{SLOT::SET, 0, 0, "Job/Tray", PARAM_INT, 1}));
    EXPECT_EQ(ticket.container.Int(0, 0, "Job/Copies"), 3);
    EXPECT_EQ(ticket.container.Text(0, 0, "Job/Name"), "A4");
}

TEST(ReadTicket, Order_IsThatOfTheStream)
{
    TicketFake ticket;
    EXPECT_TRUE(ReadInto(ticket.Access(), Encode({Int("b", 1), Int("a", 2)}).value()));
    EXPECT_THAT(ticket.container.calls,
                ElementsAre(CALL{SLOT::SETTABLE, 0, 0}, CALL{SLOT::SET, 0, 0, "b", PARAM_INT, -1},
                            CALL{SLOT::SET, 0, 0, "a", PARAM_INT, -1}));
}

TEST(ReadTicket, Positions_AreFixedOnlyIfAsked)
{
    TicketFake ticket;
    EXPECT_TRUE(ReadInto(ticket.Access(), Encode({Int("a", 1, 0)}).value(), false));
    EXPECT_THAT(ticket.container.calls,
                ElementsAre(CALL{SLOT::SETTABLE, 0, 0}, CALL{SLOT::SET, 0, 0, "a", PARAM_INT, 0}));
}

TEST(ReadTicket, Result_IsThatOfTheSlot)
{
    static int result;
    static int calls;
    TicketFake ticket;
    ticket.Access()->SSETMULTIPAR = [](void*, SETMULTIPAR*)
    {
        ++calls;
        return result;
    };
    calls = 0;
    for (int const answer : {0, 1, 2, 256, -1})
    {
        result = answer;
        EXPECT_EQ(ReadInto(ticket.Access(), Encode(Sample).value()), answer != 0) << answer;
    }
    EXPECT_EQ(calls, 5);
}

TEST(ReadTicket, BrokenStream_DoesNotTouchTheTicket)
{
    TicketFake ticket;
    std::string const stream = Encode(Sample).value();
    EXPECT_FALSE(ReadInto(ticket.Access(), stream.substr(0, stream.size() - 2) + "\xE0"));
    EXPECT_FALSE(ReadInto(ticket.Access(), "garbage"));
    EXPECT_THAT(ticket.container.calls, IsEmpty());
}

TEST(ReadTicket, NoBytes_AreASuccessWithoutACall)
{
    TicketFake ticket;
    EXPECT_TRUE(ReadInto(ticket.Access(), ""));
    EXPECT_TRUE(STICKET_BINSTREAM::Read(ticket.Access(), nullptr, 0, true));
    EXPECT_THAT(ticket.container.calls, IsEmpty());
}

TEST(ReadTicket, SignatureAlone_IsACallWithANullTable_ByDesign)
{
    static SETMULTIPAR* table;
    static int calls;
    TicketFake ticket;
    ticket.Access()->SSETMULTIPAR = [](void*, SETMULTIPAR* given)
    {
        table = given;
        ++calls;
        return 1;
    };
    SETMULTIPAR notCalled = {};
    table = &notCalled;
    calls = 0;
    EXPECT_TRUE(ReadInto(ticket.Access(), BytesOf("09 53 54 49 43 4B 45 54 5F 31")));
    EXPECT_EQ(table, nullptr);
    EXPECT_EQ(calls, 1);
}

TEST(ReadTicket, NullTicket_IsAFailureEvenForNoBytes)
{
    EXPECT_FALSE(ReadInto(nullptr, Encode(Sample).value()));
    EXPECT_FALSE(ReadInto(nullptr, ""));
}

TEST(ReadTicket, TicketWithoutTheSlot_IsAFailureEvenForNoBytes)
{
    TicketFake ticket;
    ticket.Access()->SSETMULTIPAR = nullptr;
    EXPECT_FALSE(ReadInto(ticket.Access(), Encode(Sample).value()));
    EXPECT_FALSE(ReadInto(ticket.Access(), ""));
}

// Files into a ticket.

TEST_F(StreamFile, Read_WritesToTheTicketWithFixedPositions)
{
    TicketFake ticket;
    std::string const path = folder.Write("stream", Encode(Sample).value()).string();
    EXPECT_TRUE(STICKET_BINSTREAM::Read(ticket.Access(), path.c_str()));
    EXPECT_THAT(ticket.container.calls,
                ElementsAre(CALL{SLOT::SETTABLE, 0, 0}, CALL{SLOT::SET, 0, 0, "Job/Copies", PARAM_INT, -1},
                            CALL{SLOT::SET, 0, 0, "Job/Name", PARAM_STRING, -1},
                            CALL{SLOT::SET, 0, 0, "Job/Tray", PARAM_INT, -1},
                            CALL{SLOT::SET, 0, 0, "Job/Tray", PARAM_INT, 1}));
}

TEST_F(StreamFile, Read_Garbage_IsTrueAndLeavesTheTicketAlone_ByDesign)
{
    TicketFake ticket;
    std::string const path = folder.Write("stream", "garbage").string();
    EXPECT_TRUE(STICKET_BINSTREAM::Read(ticket.Access(), path.c_str()));
    EXPECT_THAT(ticket.container.calls, IsEmpty());
}

TEST_F(StreamFile, Read_FailingTicket_IsTrueAllTheSame_ByDesign)
{
    TicketFake ticket;
    ticket.container.FailCall(0);
    std::string const path = folder.Write("stream", Encode(Sample).value()).string();
    EXPECT_TRUE(STICKET_BINSTREAM::Read(ticket.Access(), path.c_str()));
    EXPECT_FALSE(ticket.container.calls.empty());
}

TEST_F(StreamFile, Read_NullTicket_IsTrueAllTheSame_ByDesign)
{
    std::string const path = folder.Write("stream", Encode(Sample).value()).string();
    EXPECT_TRUE(STICKET_BINSTREAM::Read(nullptr, path.c_str()));
}

TEST_F(StreamFile, Read_EmptyFile_IsTrueWithoutACall)
{
    TicketFake ticket;
    std::string const path = folder.Write("stream", "").string();
    EXPECT_TRUE(STICKET_BINSTREAM::Read(ticket.Access(), path.c_str()));
    EXPECT_THAT(ticket.container.calls, IsEmpty());
}

TEST_F(StreamFile, Read_NoSuchFile_IsFalse)
{
    TicketFake ticket;
    EXPECT_FALSE(STICKET_BINSTREAM::Read(ticket.Access(), Path("none").c_str()));
    EXPECT_FALSE(STICKET_BINSTREAM::Read(nullptr, Path("none").c_str()));
    EXPECT_THAT(ticket.container.calls, IsEmpty());
}

TEST_F(StreamFile, Read_Folder_IsTrueOnceItCouldBeOpened_ByDesign)
{
    TicketFake ticket;
    EXPECT_TRUE(STICKET_BINSTREAM::Read(ticket.Access(), folder.Path().c_str()));
    EXPECT_THAT(ticket.container.calls, IsEmpty());
}

TEST_F(StreamFile, WhatWasWritten_IsRead)
{
    WalkedTicket source({Int("a", 7), Text("b", "text"), Double("c", 0.1)});
    EXPECT_TRUE(STICKET_BINSTREAM::Write(Path("stream").c_str(), source.Access(), 0));
    TicketFake target;
    EXPECT_TRUE(STICKET_BINSTREAM::Read(target.Access(), Path("stream").c_str()));
    EXPECT_EQ(target.container.Int(0, 0, "a"), 7);
    EXPECT_EQ(target.container.Text(0, 0, "b"), "text");
    EXPECT_EQ(target.container.Double(0, 0, "c"), 0.1);
}
