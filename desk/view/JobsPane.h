// The jobs and files on their way and done: how far each is, and its history. Files are dropped here or
// chosen. What the user wants done is the owner's matter. For the window's thread.
#pragma once

#include "desk/model/DroppedFiles.h"
#include "desk/model/JobBoard.h"
#include "desk/view/JobOptionsDialog.h"
#include "desk/view/VirtualList.h"
#include <functional>
#include <optional>
#include <string>
#include <vector>
#include <wx/panel.h>
#include <wx/timer.h>

class wxButton;
class wxStaticText;

namespace desk
{
class HistoryPlot;

class JobsPane : public wxPanel, private RowSource
{
public:
    // board outlives the pane.
    JobsPane(wxWindow* parent, JobBoard const& board);

    // What the user wants. files: at least one, all there a moment ago.
    std::function<void(std::vector<std::string> const& files, comgui::JobOptions const& options)> onSend =
        [](auto&, auto&) {};
    std::function<void(JobRow const&)> onCancel = [](auto&) {};  // only of a row that can be cancelled
    std::function<void(int job)> onOpen = [](int) {};            // the job's ticket
    std::function<std::vector<JobQueue>()> queues = [] { return std::vector<JobQueue>(); };

    // How he is asked; nothing: he does not want to after all.
    std::function<std::vector<std::string>()> chooseFiles;
    std::function<std::optional<comgui::JobOptions>(std::vector<std::string> const& files)> askOptions;

    // To be told of each change of the board. Shown soon: many changes at once are painted once.
    void Take(JobBoard::Change change);

    void Send();  // asks for files
    void Send(std::vector<std::string> const& paths);
    void Cancel();  // the chosen row

    JobRow const* Chosen() const;
    void Choose(RowNumber number);

private:
    enum COLUMN : unsigned
    {
        NameColumn,
        ProgressColumn,
        StateColumn,
        RateColumn,
        RestColumn,
    };

    unsigned RowCount() const override { return m_count; }
    wxVariant Cell(unsigned row, unsigned column) const override;

    void MakeList();
    void MakeKeys();
    void Arrange();
    void ShowBoard();
    void ShowChosen();
    wxString NoteOn(std::vector<RefusedPath> const& refused) const;

    JobBoard const& m_board;
    unsigned m_count = 0;  // of rows that the list knows of; the board may be ahead of it
    std::optional<RowNumber> m_chosen;
    bool m_haveRowsChanged = false;
    wxTimer m_repaint;
    wxButton* m_send;
    wxButton* m_cancel;
    wxStaticText* m_note;
    VirtualList* m_list;
    HistoryPlot* m_history;
};
}  // namespace desk
