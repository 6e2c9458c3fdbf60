// The window: tickets on the left, the keys of one on the right, what happens and what is sent below.
#pragma once

#include "desk/model/DeskSession.h"
#include "desk/model/InkCoverage.h"
#include "desk/model/JobBoard.h"
#include "desk/model/SearchRun.h"
#include "desk/model/TicketEditor.h"
#include "desk/model/TicketIndex.h"
#include "desk/model/TitleReader.h"
#include "desk/view/JobOptionsDialog.h"
#include "desk/view/Settings.h"
#include "desk/view/TicketFiles.h"
#include <map>
#include <optional>
#include <string>
#include <vector>
#include <wx/frame.h>
#include <wx/timer.h>

class wxInfoBar;
class wxNotebook;
class wxSplitterWindow;

namespace desk
{
class EventsPane;
class InkBars;
class JobsPane;
class KeysPane;
class TicketsPane;

class MainFrame : public wxFrame
{
public:
    MainFrame();
    ~MainFrame() override;

    // Asks where to log in and as whom, until it has succeeded or the user gives up. why: shown first.
    void AskForLogin(std::string const& why = {});

    // At once, without a question unless it is refused.
    void LogIn(comgui::Server const& server, comgui::Account const& account);

    // Chosen as soon as there is a login and its type is listed; then, or if the text is no ticket, it is
    // said why it cannot be.
    void ShowFirst(comgui::TicketAddress ticket) { m_first = ticket; }
    void ShowFirst(std::string const& ticket);

    FileQuestions fileQuestions = FileDialogs();

private:
    void MakePanes();
    void MakeMenus();
    void Connect();

    void LoggedIn(comgui::Server const& server, std::string const& user);
    void Take(DeskSession::State state, comgui::Error const& error);
    void ChooseFirst();
    void TakeList(int type, std::vector<int> const& ids);
    void Take(comgui::Event const& event);
    void Take(comgui::TicketUpdate const& update);
    void TakeJobs(comgui::TransferProgressed const& event);
    void TakeJobs(comgui::TransferEnded const& event);
    void TakeJobs(comgui::TicketChanged const& event);
    void TakeJobs(comgui::TicketDeleted const& event);
    void TakeJobs(comgui::ManyTicketsChanged const& event);
    void TakeJobs(comgui::ServerBack const& event);
    template <typename Other>
    void TakeJobs(Other const&)
    {
    }
    void ReadJobs(std::vector<int> const& jobs);
    std::vector<JobQueue> Queues();  // asks for the names that are not known yet

    void ShowTicket(comgui::TicketAddress ticket);
    void ShowInks(comgui::Snapshot const& ticket);
    void ForgetTickets();
    void NewTicket();
    void DeleteTicket();
    void NewKey();
    void DeleteKey();
    void Undo();
    void Redo();
    void Export();
    void Import();
    void Compare();
    void Search(std::string const& text);
    void Send(std::vector<std::string> const& files, comgui::JobOptions const& options);
    void TakeEdit(std::string const& key, std::string const& text, comgui::Value const* changed);
    bool IsForeignOverwritten(EditWrite const& foreign);
    bool IsOverwritten(wxString const& title, std::string const& key, comgui::Value const& present);

    void Say(wxString const& text);
    void Complain(wxString const& text);
    void Repaint();
    void FocusNextPane();
    void TakeKey(wxKeyEvent& event);
    static double Now();

    Settings m_settings;
    TicketIndex m_index;
    JobBoard m_jobs;
    std::map<int, comgui::Transfer> m_sent;  // on their way, by number
    InkCoverage m_coverage;
    comgui::Executor const m_here;
    DeskSession m_session;
    TitleReader m_titles;
    TicketEditor m_editor;
    std::optional<SearchRun> m_search;
    std::optional<comgui::LiveTicket> m_live;      // that is shown
    std::optional<comgui::TicketAddress> m_first;  // to be chosen once it is listed
    wxTimer m_repaint;
    wxString m_server;       // and user, as the title says them
    wxInfoBar* m_info;       // that the server is lost
    wxInfoBar* m_complaint;  // anything else, beside it
    wxNotebook* m_below;
    wxSplitterWindow* m_middle;
    TicketsPane* m_tickets;
    KeysPane* m_keys;
    EventsPane* m_events;
    JobsPane* m_transfers;
    InkBars* m_inks;
};
}  // namespace desk
