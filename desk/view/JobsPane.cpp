#include "desk/view/JobsPane.h"

#include "desk/view/HistoryPlot.h"
#include "desk/view/NumberText.h"
#include "desk/view/ShownText.h"
#include <comgui/client/Text.h>
#include <wx/button.h>
#include <wx/dnd.h>
#include <wx/filedlg.h>
#include <wx/intl.h>
#include <wx/sizer.h>
#include <wx/stattext.h>

namespace desk
{
namespace
{
constexpr std::size_t NameLength = 120;
constexpr int RepaintPause = 50;  // milliseconds

class FileDrop : public wxFileDropTarget
{
public:
    explicit FileDrop(std::function<void(std::vector<std::string>)> drop) : m_drop(std::move(drop)) {}

    bool OnDropFiles(wxCoord, wxCoord, wxArrayString const& names) override
    {
        std::vector<std::string> paths;
        for (wxString const& name : names)
            paths.push_back(comgui::ToUtf8(name));
        m_drop(std::move(paths));
        return true;
    }

private:
    std::function<void(std::vector<std::string>)> const m_drop;
};

std::vector<std::string> AskForFiles(wxWindow* parent)
{
    wxFileDialog dialog(parent, _("Send job"), {}, {}, wxFileSelectorDefaultWildcardStr,
                        wxFD_OPEN | wxFD_FILE_MUST_EXIST | wxFD_MULTIPLE);
    std::vector<std::string> paths;
    wxArrayString chosen;
    if (dialog.ShowModal() == wxID_OK)
        dialog.GetPaths(chosen);
    for (wxString const& path : chosen)
        paths.push_back(comgui::ToUtf8(path));
    return paths;
}

wxString StateText(JobRow const& row)
{
    switch (row.state)
    {
    case JobState::Waiting:
        return _("Waiting");
    case JobState::Sending:
        return _("Sending");
    case JobState::Arrived:
        return _("Arrived");
    case JobState::Cancelled:
        return _("Cancelled");
    default:
        return wxString::Format(_("Failed: %s"), ShownText(row.error.Text()));
    }
}

wxString RefusalText(RefusedPath const& path)
{
    wxString const name = ShownText(path.path, NameLength);
    switch (path.why)
    {
    case Refusal::Folder:
        return wxString::Format(_("%s is a folder: send the files in it."), name);
    case Refusal::NotThere:
        return wxString::Format(_("%s is not there."), name);
    case Refusal::Empty:
        return wxString::Format(_("%s is empty."), name);
    default:
        return wxString::Format(_("%s is no file."), name);
    }
}
}  // namespace

JobsPane::JobsPane(wxWindow* parent, JobBoard const& board)
    : wxPanel(parent, wxID_ANY, wxDefaultPosition, wxDefaultSize, wxTAB_TRAVERSAL, "jobs pane"),
      chooseFiles([this] { return AskForFiles(this); }),
      askOptions(
          [this](std::vector<std::string> const& files)
          {
              JobOptionsDialog dialog(this, files, queues());
              return dialog.ShowModal() == wxID_OK ? std::optional(dialog.Options()) : std::nullopt;
          }),
      m_board(board), m_send(new wxButton(this, wxID_ANY, _("&Send job ..."))),
      m_cancel(new wxButton(this, wxID_ANY, _("Canc&el"))), m_note(new wxStaticText(this, wxID_ANY, {}))
{
    m_send->SetName("send job");
    m_cancel->SetName("cancel job");
    m_note->SetName("jobs note");
    MakeList();
    m_history = new HistoryPlot(this);
    Arrange();
    MakeKeys();
    m_send->Bind(wxEVT_BUTTON, [this](auto&) { Send(); });
    m_cancel->Bind(wxEVT_BUTTON, [this](auto&) { Cancel(); });
    m_repaint.Bind(wxEVT_TIMER, [this](auto&) { ShowBoard(); });
    // A dialog within the drop would keep the program waiting that files come from.
    SetDropTarget(new FileDrop([this](std::vector<std::string> const& paths)
                               { CallAfter([this, paths] { Send(paths); }); }));
    m_haveRowsChanged = true;
    ShowBoard();
}

void JobsPane::MakeList()
{
    m_list = new VirtualList(this, "jobs", *this);
    m_list->AddTextColumn(_("Name"), 220);
    m_list->AddColumn(_("Progress"), 120, new wxDataViewProgressRenderer);
    m_list->AddTextColumn(_("State"), 160);
    m_list->AddTextColumn(_("Rate"), 90, wxALIGN_RIGHT);
    m_list->AddTextColumn(_("Rest"), 70, wxALIGN_RIGHT);
    m_list->Bind(wxEVT_DATAVIEW_SELECTION_CHANGED,
                 [this](auto&)
                 {
                     auto const row = m_list->Selected();
                     m_chosen = row && *row < m_board.Count() ? std::optional(m_board.At(*row).number)
                                                              : std::nullopt;
                     ShowChosen();
                 });
    m_list->Bind(wxEVT_DATAVIEW_ITEM_ACTIVATED,
                 [this](auto&)
                 {
                     if (JobRow const* const row = Chosen(); row && row->job)
                         onOpen(*row->job);
                 });
}

void JobsPane::MakeKeys()
{
    Bind(wxEVT_CHAR_HOOK,
         [this](wxKeyEvent& event)
         {
             bool const isPlain = event.GetModifiers() == wxMOD_NONE;
             if (isPlain && (event.GetKeyCode() == WXK_DELETE || event.GetKeyCode() == WXK_NUMPAD_DELETE))
                 Cancel();
             else if (isPlain &&
                      (event.GetKeyCode() == WXK_INSERT || event.GetKeyCode() == WXK_NUMPAD_INSERT))
                 Send();
             else
                 event.Skip();
         });
}

void JobsPane::Arrange()
{
    auto* const buttons = new wxBoxSizer(wxHORIZONTAL);
    buttons->Add(m_send, wxSizerFlags().Border());
    buttons->Add(m_cancel, wxSizerFlags().Border(wxTOP | wxRIGHT | wxBOTTOM));
    buttons->Add(m_note, wxSizerFlags(1).CentreVertical());
    auto* const shown = new wxBoxSizer(wxHORIZONTAL);
    shown->Add(m_list, wxSizerFlags(3).Expand());
    shown->Add(m_history, wxSizerFlags(1).Expand());
    auto* const all = new wxBoxSizer(wxVERTICAL);
    all->Add(buttons, wxSizerFlags().Expand());
    all->Add(shown, wxSizerFlags(1).Expand());
    SetSizer(all);
}

wxVariant JobsPane::Cell(unsigned index, unsigned column) const
{
    JobRow const none;
    JobRow const& row = index < m_board.Count() ? m_board.At(index) : none;  // has just gone
    switch (column)
    {
    case NameColumn:
        return ShownText(row.name, NameLength);
    case ProgressColumn:
        return static_cast<long>(row.percent.value_or(0));
    case StateColumn:
        return StateText(row);
    case RateColumn:
        return row.progress.rate > 0 ? RateText(row.progress.rate) : wxString();
    default:
        return row.progress.rest ? TimeText(static_cast<double>(row.progress.rest->count())) : wxString();
    }
}

void JobsPane::Take(JobBoard::Change change)
{
    if (change == JobBoard::Change::None)
        return;
    m_haveRowsChanged = m_haveRowsChanged || change == JobBoard::Change::Rows;
    if (!m_repaint.IsRunning())
        m_repaint.StartOnce(RepaintPause);
}

void JobsPane::ShowBoard()
{
    if (m_haveRowsChanged)
    {
        m_haveRowsChanged = false;
        auto const chosen = m_chosen;  // rows move, what is chosen stays
        m_list->UnselectAll();
        m_count = static_cast<unsigned>(m_board.Count());
        m_list->Reset();
        if (chosen && m_board.Find(*chosen))
            Choose(*chosen);
        else
            m_chosen.reset();
    }
    else
        m_list->RowsLookDifferent();
    ShowChosen();
}

JobRow const* JobsPane::Chosen() const { return m_chosen ? m_board.Find(*m_chosen) : nullptr; }

void JobsPane::Choose(RowNumber number)
{
    auto const index = m_board.IndexOf(number);
    if (!index)
        return;
    m_chosen = number;
    m_list->SelectRow(static_cast<unsigned>(*index));
    ShowChosen();
}

void JobsPane::ShowChosen()
{
    JobRow const* const row = Chosen();
    m_cancel->Enable(row && row->IsCancellable());
    std::vector<PlotLine> lines;
    if (row && row->transfer)
        lines.push_back({_("Rate"), row->rates, Quantity::DecimalBytes, &RateText});
    if (row && !row->percents.IsEmpty())
        lines.push_back({_("Progress"), row->percents, Quantity::Number, &PercentText});
    m_history->Take(std::move(lines));
}

void JobsPane::Send() { Send(chooseFiles()); }

void JobsPane::Send(std::vector<std::string> const& paths)
{
    auto const [files, refused] = Sifted(paths);
    m_note->SetLabelText(NoteOn(refused));
    Layout();
    if (files.empty())
        return;
    if (auto const options = askOptions(files))
        onSend(files, *options);
}

// The first one and the number of the others: it must be one line.
wxString JobsPane::NoteOn(std::vector<RefusedPath> const& refused) const
{
    if (refused.empty())
        return {};
    wxString const first = RefusalText(refused.front());
    std::size_t const others = refused.size() - 1;
    if (others == 0)
        return first;
    return wxString::Format(wxPLURAL("%s %zu other cannot be sent either.",
                                     "%s %zu others cannot be sent either.", PluralOf(others)),
                            first, others);
}

void JobsPane::Cancel()
{
    if (JobRow const* const row = Chosen(); row && row->IsCancellable())
        onCancel(*row);
}
}  // namespace desk
