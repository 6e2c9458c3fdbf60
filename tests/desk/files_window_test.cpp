// Tickets to files and back, as the menu does it.
#include "tests/desk/WindowOfTheDesk.h"

#include <filesystem>
#include <fstream>
#include <gmock/gmock.h>
#include <sstream>

namespace fs = std::filesystem;
using namespace desk;
using testing::HasSubstr;

namespace
{
std::string ContentOf(fs::path const& file)
{
    std::ostringstream content;
    content << std::ifstream(file, std::ios::binary).rdbuf();
    return content.str();
}

class FilesOfTheDesk : public WindowOfTheDesk
{
protected:
    comgui::TicketAddress ShownJob()
    {
        Enter();
        comgui::TicketAddress const job = NewTicket();
        (void)tickets.WriteAll(job, {{"Job/Copies", 3},
                                     {"Job/List", comgui::MakeList<int>({1, 2})},
                                     {"Job/Text", "gr\xC3\xBC\xC3\x9F"}});
        ShowJob(job);
        EXPECT_TRUE(Await([this] { return keys.RowOf(0, "Copies").has_value(); }));
        return job;
    }
    // Gives how many questions are asked about it.
    int Export(fs::path const& file, FileForm form, int answer = wxID_YES)
    {
        frame->fileQuestions.askForTarget = [=](auto*, auto&) { return ExportFile{file, form}; };
        Answers const user(answer);
        Menu(MenuOf("Ticket", "Export ..."));
        return user.Asked();
    }
    void Import(fs::path const& file)
    {
        frame->fileQuestions.askForSource = [=](auto*) { return file.string(); };
        Menu(MenuOf("Ticket", "Import ..."));
    }
    bool Says(std::string const& text) const
    {
        return Await([&] { return Status().find(text) != std::string::npos; });
    }
};
}  // namespace

TEST_F(FilesOfTheDesk, TicketThatIsExported_ComesBackAsANewOne)
{
    comgui::TicketAddress const job = ShownJob();
    for (FileForm const form : {FileForm::Xml, FileForm::Stream})
    {
        fs::path const file = folder / (form == FileForm::Xml ? "ticket.xml" : "ticket.stream");
        EXPECT_EQ(Export(file, form), 0);
        ASSERT_TRUE(Says("Exported: 3 keys")) << Status();
        auto const before = tickets.List(comgui::JobTickets)->size();
        Import(file);
        ASSERT_TRUE(Says("Imported: 3 keys")) << Status();
        ASSERT_EQ(tickets.List(comgui::JobTickets)->size(), before + 1);
        comgui::TicketAddress const made = tickets.List(comgui::JobTickets)->back();
        EXPECT_EQ(*tickets.ReadAll(made), *tickets.ReadAll(job));
        EXPECT_TRUE(Await([&] { return heading() == "Jobs 3/" + std::to_string(made.id); })) << heading();
        ShowJob(job);
    }
}

TEST_F(FilesOfTheDesk, FileThatCannotBeWritten_IsSaid)
{
    ShownJob();
    Export(folder / "no folder" / "ticket.xml", FileForm::Xml);
    EXPECT_TRUE(Says("No such file or directory")) << Status();
}

TEST_F(FilesOfTheDesk, FileThatGetsItsEnding_IsOverwrittenOnlyIfTheUserWantsIt)
{
    ShownJob();
    folder.Write("ticket.stream", "mine");
    EXPECT_EQ(Export(folder / "ticket", FileForm::Stream, wxID_NO), 1);
    RunEvents();
    EXPECT_EQ(ContentOf(folder / "ticket.stream"), "mine");
    EXPECT_EQ(Export(folder / "ticket", FileForm::Stream, wxID_YES), 1);
    ASSERT_TRUE(Says("Exported: 3 keys")) << Status();
    EXPECT_THAT(ContentOf(folder / "ticket.stream"), HasSubstr("STICKET_1"));
}

TEST_F(FilesOfTheDesk, FileThatIsDamaged_MakesNoTicket)
{
    ShownJob();
    auto const before = tickets.List(comgui::JobTickets)->size();
    for (char const* const content : {"", "<ticket", "no ticket at all"})
    {
        frame->GetStatusBar()->SetStatusText("");
        Import(folder.Write("damaged.xml", content));
        EXPECT_TRUE(Await([this] { return !Status().empty(); }));
        EXPECT_EQ(Status().find("Imported"), std::string::npos) << Status();
    }
    EXPECT_EQ(tickets.List(comgui::JobTickets)->size(), before);
}
