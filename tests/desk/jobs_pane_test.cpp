#include "desk/view/JobsPane.h"

#include "desk/view/HistoryPlot.h"
#include <chrono>
#include <comgui/client/Text.h>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <gtest/gtest.h>
#include <wx/app.h>
#include <wx/button.h>
#include <wx/choice.h>
#include <wx/dnd.h>
#include <wx/evtloop.h>
#include <wx/frame.h>
#include <wx/stattext.h>

namespace fs = std::filesystem;
using namespace desk;

namespace
{
class JobsPaneTest : public testing::Test
{
protected:
    JobsPaneTest()
    {
        std::string name = (fs::temp_directory_path() / "jobs-XXXXXX").string();
        m_folder = mkdtemp(name.data());
        m_pane->onSend = [this](auto const& files, auto const& options)
        {
            m_sent = files;
            m_options = options;
        };
        m_pane->onCancel = [this](JobRow const& row) { m_cancelled.push_back(row.transfer.value_or(-1)); };
        m_pane->askOptions = [](auto const&) { return comgui::JobOptions{"name", 3, 2}; };
        m_pane->chooseFiles = [this] { return std::vector{File("chosen.pdf")}; };
        m_frame->Show();
    }
    ~JobsPaneTest() override
    {
        delete m_frame;  // at once: it must not outlive what it shows
        fs::remove_all(m_folder);
    }

    std::string File(std::string const& name) const
    {
        std::ofstream(m_folder / name) << "content";
        return (m_folder / name).string();
    }
    template <typename T>
    T* Find(wxString const& name) const
    {
        return dynamic_cast<T*>(wxWindow::FindWindowByName(name, m_pane));
    }
    wxString Cell(unsigned row, unsigned column) const
    {
        auto* const model = static_cast<wxDataViewVirtualListModel*>(Find<VirtualList>("jobs")->GetModel());
        wxVariant value;
        model->GetValueByRow(value, row, column);
        return value.MakeString();
    }
    unsigned Rows() const
    {
        return static_cast<wxDataViewVirtualListModel*>(Find<VirtualList>("jobs")->GetModel())->GetCount();
    }
    void Press(int key) const
    {
        wxKeyEvent event(wxEVT_CHAR_HOOK);
        event.m_keyCode = key;
        m_pane->HandleWindowEvent(event);
    }
    template <typename CONDITION>
    bool ComesTrue(CONDITION condition) const
    {
        auto const end = std::chrono::steady_clock::now() + std::chrono::seconds(10);
        while (!condition() && std::chrono::steady_clock::now() < end)
        {
            wxEventLoopBase::GetActive()->YieldFor(wxEVT_CATEGORY_ALL);
            wxTheApp->ProcessPendingEvents();
        }
        return condition();
    }

    fs::path m_folder;
    JobBoard m_board;
    wxFrame* m_frame = new wxFrame(nullptr, wxID_ANY, "test", wxDefaultPosition, wxSize(900, 300));
    JobsPane* m_pane = new JobsPane(m_frame, m_board);
    std::vector<std::string> m_sent;
    comgui::JobOptions m_options;
    std::vector<int> m_cancelled;
};
}  // namespace

TEST_F(JobsPaneTest, ARowTellsHowFarAJobIs)
{
    m_pane->Take(m_board.Add(1, "a\nb.pdf"));
    m_pane->Take(m_board.Take(comgui::TransferProgressed{1, {25, 100, 1.5e6, std::chrono::seconds(65)}}, 1));
    ASSERT_TRUE(ComesTrue([&] { return Rows() == 1; }));
    EXPECT_FALSE(Cell(0, 0).Contains("\n"));
    EXPECT_EQ(Cell(0, 1), "25");
    EXPECT_EQ(Cell(0, 2), "Sending");
    EXPECT_EQ(Cell(0, 3), "1.50 MB/s");
    EXPECT_EQ(Cell(0, 4), "1:05");
    m_board.Take(comgui::TransferEnded{1, comgui::Error{116, "b.pdf", "disk full"}, {}}, 2);
    EXPECT_TRUE(Cell(0, 2).StartsWith("Failed: "));
    EXPECT_TRUE(Cell(0, 2).Contains("disk full"));
    EXPECT_EQ(Cell(0, 3), "");
}

TEST_F(JobsPaneTest, RowsComeAndGoSoon)
{
    for (int i = 0; i < 5; ++i)
        m_pane->Take(m_board.Add(i, "job"));
    EXPECT_TRUE(ComesTrue([&] { return Rows() == 5; }));
    m_board.Take(comgui::TransferEnded{2, {}, {}}, 1);
    m_pane->Take(m_board.RemoveOver());
    EXPECT_TRUE(ComesTrue([&] { return Rows() == 4; }));
}

TEST_F(JobsPaneTest, WhatIsChosenStaysSoWhenRowsMove)
{
    for (int i = 0; i < 5; ++i)
        m_pane->Take(m_board.Add(i, "job " + std::to_string(i)));
    auto* const list = Find<VirtualList>("jobs");
    ASSERT_TRUE(ComesTrue([&] { return Rows() == 5; }));
    m_pane->Choose(m_board.At(3).number);
    m_board.Take(comgui::TransferEnded{0, {}, {}}, 1);
    m_pane->Take(m_board.RemoveOver());
    ASSERT_TRUE(ComesTrue([&] { return Rows() == 4; }));
    ASSERT_NE(m_pane->Chosen(), nullptr);
    EXPECT_EQ(m_pane->Chosen()->name, "job 3");
    EXPECT_EQ(list->Selected(), 2U);
}

TEST_F(JobsPaneTest, OnlyAJobOnItsWayCanBeCancelled)
{
    m_board.Add(4, "a");
    m_pane->Take(JobBoard::Change::Rows);
    Press(WXK_DELETE);
    EXPECT_TRUE(m_cancelled.empty());  // nothing is chosen
    auto* const button = Find<wxButton>("cancel job");
    EXPECT_FALSE(button->IsEnabled());
    ASSERT_TRUE(ComesTrue([&] { return Rows() == 1; }));
    m_pane->Choose(m_board.At(0).number);
    EXPECT_TRUE(button->IsEnabled());
    Press(WXK_DELETE);
    EXPECT_EQ(m_cancelled, std::vector{4});
    m_pane->Take(m_board.Take(comgui::TransferEnded{4, {}, {}}, 1));
    EXPECT_TRUE(ComesTrue([&] { return !button->IsEnabled(); }));
    Press(WXK_DELETE);
    EXPECT_EQ(m_cancelled.size(), 1U);
}

TEST_F(JobsPaneTest, InsertSendsWhatTheUserChooses)
{
    Press(WXK_INSERT);
    EXPECT_EQ(m_sent, std::vector{(m_folder / "chosen.pdf").string()});
    EXPECT_EQ(m_options.queue, 3);
    EXPECT_EQ(m_options.copies, 2);
}

TEST_F(JobsPaneTest, ADialogThatIsCancelledSendsNothing)
{
    m_pane->askOptions = [](auto const&) { return std::nullopt; };
    Press(WXK_INSERT);
    m_pane->chooseFiles = [] { return std::vector<std::string>(); };
    m_pane->askOptions = [](auto const&) { return comgui::JobOptions(); };
    Press(WXK_INSERT);
    EXPECT_TRUE(m_sent.empty());
}

TEST_F(JobsPaneTest, FilesAreDroppedSeveralAtOnceAndFoldersRefused)
{
    wxArrayString paths;
    for (std::string const& path : {File("a.pdf"), m_folder.string(), File("b.pdf")})
        paths.push_back(comgui::ToWx(path));
    auto* const target = dynamic_cast<wxFileDropTarget*>(m_pane->GetDropTarget());
    ASSERT_NE(target, nullptr);
    EXPECT_TRUE(target->OnDropFiles(0, 0, paths));
    EXPECT_TRUE(ComesTrue([&] { return m_sent.size() == 2; }));
    wxString const note = Find<wxStaticText>("jobs note")->GetLabelText();
    EXPECT_EQ(note, comgui::ToWx(m_folder.string()) + " is a folder: send the files in it.");
    m_pane->Send({File("a.pdf")});
    EXPECT_EQ(Find<wxStaticText>("jobs note")->GetLabelText(), "");
}

TEST_F(JobsPaneTest, TheChosenJobShowsItsHistory)
{
    m_board.Add(1, "a");
    m_board.Take(comgui::TransferProgressed{1, {25, 100, 1e6, {}}}, 1);
    m_board.Take(comgui::TransferProgressed{1, {75, 100, 2e6, {}}}, 6);
    m_pane->Take(JobBoard::Change::Rows);
    auto* const history = Find<HistoryPlot>("history");
    ASSERT_NE(history, nullptr);
    EXPECT_EQ(history->GetLabel(), "No history yet");
    ASSERT_TRUE(ComesTrue([&] { return Rows() == 1; }));
    m_pane->Choose(m_board.At(0).number);
    EXPECT_EQ(history->GetLabel(), "Rate: now 2.00 MB/s, least 1.00 MB/s, most 2.00 MB/s; "
                                   "Progress: now 75.0 %, least 25.0 %, most 75.0 %; over 0:05");
}

TEST_F(JobsPaneTest, TheDialogGivesWhatIsChosen)
{
    JobOptionsDialog dialog(m_frame, {"/srv/poster.pdf"}, {{7, "Fast"}, {9, "Slow"}});
    EXPECT_EQ(dialog.Options().name, "poster.pdf");
    EXPECT_FALSE(dialog.Options().queue);
    EXPECT_EQ(dialog.Options().copies, 1);
    dynamic_cast<wxChoice*>(wxWindow::FindWindowByName("queue", &dialog))->SetSelection(2);
    EXPECT_EQ(dialog.Options().queue, 9);
    JobOptionsDialog const several(m_frame, {"/srv/a", "/srv/b"}, {});
    EXPECT_EQ(several.Options().name, "");
}

TEST_F(JobsPaneTest, TheDialogNumbersQueues_AlsoWithoutAName)
{
    JobOptionsDialog const dialog(m_frame, {"/srv/poster.pdf"}, {{7, "Fast"}, {9, ""}});
    auto* const queue = dynamic_cast<wxChoice*>(wxWindow::FindWindowByName("queue", &dialog));
    ASSERT_NE(queue, nullptr);
    EXPECT_EQ(queue->GetString(1), "7/7 Fast");
    EXPECT_EQ(queue->GetString(2), "7/9");
}
