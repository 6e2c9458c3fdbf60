#include "tools/comgui_site/import.h"

#include "comgui/testing/TemporaryFolder.h"
#include "tests/support/Files.h"
#include "tests/tools/SiteTest.h"
#include "tools/comgui_site/export.h"

using comgui::test::TemporaryFolder;

using namespace comgui_site;
using namespace standin;
using testing::AllOf;
using testing::ElementsAre;
using testing::HasSubstr;
using Mode = TicketCommits::Mode;

namespace
{
class SiteImport : public SiteTest
{
protected:
    std::string File(std::string const& name, std::string_view text)
    {
        return folder.Write(name, text).string();
    }
    std::string Refusal(std::vector<std::string> const& files)
    {
        return TroubleOf([&] { ReadTickets(files); });
    }
    static std::string Names(std::vector<TicketXml> const& tickets)
    {
        std::string names;
        for (TicketXml const& ticket : tickets)
            names += comgui_site::TextOf(*ticket.address) + " ";
        return names;
    }

    TemporaryFolder const folder;
};

using SiteExport = SiteImport;
}  // namespace

TEST_F(SiteImport, ReadTickets_OfFilesAndDocuments_AreInOrder)
{
    auto const one = File("one", "<ticket version='1' type='3' id='9'/>");
    auto const many = File("many", "<!-- <ticket/> --><site version='1'><ticket type='7' id='1'/>"
                                   "<ticket version='1' type='0' id='0'/></site>");
    EXPECT_EQ(Names(ReadTickets({one, many})), "0/0 3/9 7/1 ");
}

TEST_F(SiteImport, ReadTickets_OfWhatIsNone_NamesFileAndLine)
{
    EXPECT_THAT(Refusal({File("a", "<ticket version='1'/>")}),
                AllOf(HasSubstr("a:1"), HasSubstr("no type and id")));
    EXPECT_THAT(Refusal({File("b", "<site version='1'>\n<ticket version='1'/></site>")}),
                AllOf(HasSubstr("b:2"), HasSubstr("no type and id")));
    EXPECT_THAT(Refusal({File("c", "<site version='1'>\n\n<users/></site>")}),
                AllOf(HasSubstr("c:3"), HasSubstr("users add")));
    EXPECT_THAT(Refusal({File("d", "<site version='1'><other/></site>")}),
                HasSubstr("unknown element <other>"));
    EXPECT_THAT(Refusal({File("e", "<site version='2'/>")}), HasSubstr("version 1 expected"));
    EXPECT_THAT(Refusal({File("f", "<table version='1'/>")}), HasSubstr("<ticket> expected, not <table>"));
    EXPECT_THAT(Refusal({File("g", "<ticket version='1' type='3' id='1'>")}), HasSubstr("g:1"));
    EXPECT_THAT(Refusal({File("h", "")}), HasSubstr("h:1"));
    EXPECT_THAT(Refusal({File("i", "\x01")}), HasSubstr("control character"));
    EXPECT_THAT(Refusal({(folder / "nothing").string()}), HasSubstr("cannot be read"));
}

TEST_F(SiteImport, ReadTickets_OfOneAddressTwice_NamesBothFiles)
{
    std::string const text = "<ticket version='1' type='3' id='9'/>";
    auto const a = File("a", text);
    auto const b = File("b", text);
    EXPECT_EQ(Refusal({a, b}),
              "the ticket 3/9 comes twice, from " + a + " and from " + b + "; leave one out");
}

TEST_F(SiteImport, Import_TellsEachTicket)
{
    Put({3, 1}, "A", Integer(PARAM_INT, 1));
    auto const tickets =
        ReadTickets({File("a", "<site version='1'><ticket type='3' id='1'><parameter key='A' "
                               "type='int'>1</parameter></ticket><ticket type='3' id='2'/></site>")});
    std::vector<std::string> told;
    Import(store, tickets, Mode::Merge,
           [&](TicketAddress address, auto const& done)
           { told.push_back(comgui_site::TextOf(address) + " " + std::to_string(done.kind)); });
    EXPECT_THAT(told, ElementsAre("3/1 0", "3/2 1"));
}

TEST_F(SiteImport, Import_ThatFails_SaysWhichAndHowFar)
{
    auto const tickets = ReadTickets(
        {File("a", "<site version='1'><ticket type='3' id='1'/><ticket type='3' id='2'/></site>")});
    site->FailOperation(4);  // load and commit of the first, then of the second
    EXPECT_THAT(
        TroubleOf([&] { Import(store, tickets, Mode::Merge, [](auto, auto const&) {}); }),
        AllOf(HasSubstr("ticket 3/2 is not imported: "), HasSubstr("(1 of 2 tickets before it are)")));
    EXPECT_TRUE(site->HasFailed());
    EXPECT_EQ(Ticket({3, 1}), "");
    EXPECT_EQ(Ticket({3, 2}), "none");
}

TEST_F(SiteImport, WriteMirror_IsTheSystemTicket)
{
    Put({0, 0}, "System/Name", Bytes(PARAM_STRING, "Press"));
    WriteMirror(store, folder.Path());
    EXPECT_THAT(ContentOf(folder / "tickets/SYS_0000.xml"), HasSubstr(">Press<"));
}

TEST_F(SiteExport, Chosen_NothingSaid_IsAll)
{
    EXPECT_EQ(Chosen(store, {}).size(), 3u);
    EXPECT_THAT(Chosen(store, {{17, 2}, {0}, {17, 2}}),
                ElementsAre(TicketAddress{0, 0}, TicketAddress{17, 2}));
}

TEST_F(SiteExport, Chosen_WhatIsNotThere_IsTrouble)
{
    EXPECT_EQ(TroubleOf(
                  [&] {
                      Chosen(store, {{0}, {5}});
                  }),
              "there is no ticket of type 5; info lists the types");
    EXPECT_EQ(TroubleOf([&] { Chosen(store, {{17, 5}}); }), "there is no ticket 17/5; info lists the types");
}

TEST_F(SiteExport, EachForm_ComesBackAsItWas)
{
    Put({3, 1}, "Plain", Bytes(PARAM_STRING, " a\nb "));
    Put({3, 1}, "Bytes", Bytes(PARAM_BINSTRING, std::string_view("\0\xFF", 2)), 3);
    Put({3, 1}, "Bad\x01", Bytes(PARAM_STRING, "\x1B\r"));
    Put({3, 2}, "Number", Double(-0.0));
    auto const chosen = Chosen(store, {{3}});
    auto const document = File("document", ExportToDocument(store, chosen).text);
    auto const single = File("single", ExportOne(store, {3, 2}).text);
    EXPECT_EQ(ExportToFolder(store, chosen, folder / "new/folder", false), 2u);
    EXPECT_THAT(NamesIn(folder / "new/folder"), ElementsAre("3_1.xml", "3_2.xml"));
    for (auto const& files :
         {std::vector{document}, std::vector{(folder / "new/folder/3_1.xml").string(), single}})
    {
        auto const fresh = std::make_shared<MemorySite>();
        MemoryStore other(fresh);
        Import(other, ReadTickets(files), Mode::Merge, [](auto, auto const&) {});
        for (TicketAddress const address : chosen)
            EXPECT_EQ(Load(other, address)->values.Text(), Load(store, address)->values.Text());
    }
}

TEST_F(SiteExport, ToAFolder_ReplacesNothingUnasked)
{
    auto const old = File("to/17_2.xml", "old");
    auto const chosen = Chosen(store, {});
    EXPECT_THAT(TroubleOf([&] { ExportToFolder(store, chosen, folder / "to", false); }),
                HasSubstr("17_2.xml: is there already"));
    EXPECT_EQ(ContentOf(old), "old");
    EXPECT_THAT(NamesIn(folder / "to"), ElementsAre("17_2.xml"));
    EXPECT_EQ(ExportToFolder(store, chosen, folder / "to", true), 3u);
    EXPECT_THAT(ContentOf(old), HasSubstr("<ticket"));
}

TEST_F(SiteExport, OfTicketsThatAreGone_LeavesThemOut)
{
    EXPECT_EQ(ExportToDocument(store, {{0, 0}, {3, 77}}).tickets, 1u);
    EXPECT_EQ(ExportToFolder(store, {{0, 0}, {3, 77}}, folder.Path(), false), 1u);
    EXPECT_EQ(TroubleOf([&] { ExportOne(store, {3, 77}); }), "there is no ticket 3/77 any more");
}
