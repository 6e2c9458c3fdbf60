#include "desk/view/MainFrame.h"

#include "desk/model/DisplayText.h"
#include "desk/model/ServerName.h"
#include "desk/model/TicketName.h"
#include "desk/view/CompareFrame.h"
#include "desk/view/EventsPane.h"
#include "desk/view/InkBars.h"
#include "desk/view/JobsPane.h"
#include "desk/view/KeysPane.h"
#include "desk/view/LoginDialog.h"
#include "desk/view/NewKeyDialog.h"
#include "desk/view/NumberText.h"
#include "desk/view/ShownText.h"
#include "desk/view/TicketFiles.h"
#include "desk/view/TicketsPane.h"
#include <algorithm>
#include <chrono>
#include <comgui/client/Text.h>
#include <memory>
#include <wx/accel.h>
#include <wx/dataview.h>
#include <wx/infobar.h>
#include <wx/menu.h>
#include <wx/msgdlg.h>
#include <wx/notebook.h>
#include <wx/numdlg.h>
#include <wx/sizer.h>
#include <wx/splitter.h>
#include <wx/textdlg.h>

namespace desk
{
namespace
{
constexpr int RepaintPause = 50;  // milliseconds; however many events come meanwhile
constexpr char WindowName[] = "MainWindow";

wxString NoTicket() { return _("This is no ticket: a number, or a type, a slash and a number."); }

wxString NameOf(comgui::TicketAddress ticket) { return wxString::Format("%d/%d", ticket.type, ticket.id); }

// How far a search is, and what it has not seen.
wxString NoteOf(SearchBatch const& batch)
{
    wxString note =
        wxString::Format(_("%zu found, %zu of %zu looked at"), batch.found, batch.done, batch.total);
    if (batch.unreadable > 0)
        note += "\n" + wxString::Format(wxPLURAL("%zu ticket cannot be read", "%zu tickets cannot be read",
                                                 PluralOf(batch.unreadable)),
                                        batch.unreadable);
    if (batch.state == SearchState::Enough)
        note += "\n" + wxString::Format(_("More than %zu are not looked for"), batch.found);
    if (batch.error)
        note += "\n" + wxString::Format(_("Interrupted: %s"), ShownText(batch.error->Text()));
    return note;
}
}  // namespace

MainFrame::MainFrame()
    : wxFrame(nullptr, wxID_ANY, _("Ticket desk")), m_here(comgui::OnThreadOf(*this)), m_session(m_here),
      m_titles(m_session.Tickets(), m_session.Worker()), m_editor(m_session.Tickets(), m_session.Worker())
{
    SetName("desk");
    SetSize(FromDIP(wxSize(1200, 800)));
    MakePanes();
    MakeMenus();
    CreateStatusBar();
    Connect();
    m_settings.Restore(*this, WindowName);
    Take(DeskSession::State::LoggedOut, {});
}

// Panes look at the models to their end.
MainFrame::~MainFrame()
{
    m_settings.Keep(*this, WindowName);
    DestroyChildren();
}

void MainFrame::MakePanes()
{
    m_info = new wxInfoBar(this);
    m_info->SetName("info");
    m_complaint = new wxInfoBar(this);
    m_complaint->SetName("complaint");
    auto* const whole =
        new wxSplitterWindow(this, wxID_ANY, wxDefaultPosition, wxDefaultSize, wxSP_LIVE_UPDATE);
    m_tickets = new TicketsPane(whole, m_index, [this](auto ticket) { return m_titles.TitleOf(ticket); });
    auto* const right =
        new wxSplitterWindow(whole, wxID_ANY, wxDefaultPosition, wxDefaultSize, wxSP_LIVE_UPDATE);
    m_middle = new wxSplitterWindow(right, wxID_ANY, wxDefaultPosition, wxDefaultSize, wxSP_LIVE_UPDATE);
    m_keys = new KeysPane(m_middle);
    m_inks = new InkBars(m_middle);
    m_below = new wxNotebook(right, wxID_ANY);
    m_events = new EventsPane(m_below);
    m_transfers = new JobsPane(m_below, m_jobs);
    m_below->AddPage(m_events, _("Events"));
    m_below->AddPage(m_transfers, _("Jobs"));
    for (wxSplitterWindow* const each : {whole, right, m_middle})
        each->SetMinimumPaneSize(FromDIP(120));
    whole->SplitVertically(m_tickets, right, FromDIP(320));
    right->SplitHorizontally(m_middle, m_below, -FromDIP(260));
    right->SetSashGravity(0.7);
    m_middle->SetSashGravity(1);
    m_inks->Hide();
    m_middle->Initialize(m_keys);

    auto* const all = new wxBoxSizer(wxVERTICAL);
    all->Add(m_info, wxSizerFlags().Expand());
    all->Add(m_complaint, wxSizerFlags().Expand());
    all->Add(whole, wxSizerFlags(1).Expand());
    SetSizer(all);
}

void MainFrame::MakeMenus()
{
    auto* const bar = new wxMenuBar;
    auto const add = [this](wxMenu* menu, wxString const& text, auto action, int id = wxID_ANY)
    {
        wxMenuItem* const item = menu->Append(id, text);
        Bind(
            wxEVT_MENU, [action](auto&) { action(); }, item->GetId());
    };
    auto* const server = new wxMenu;
    add(server, _("Log &in ...\tCtrl+L"), [this] { AskForLogin(); });
    add(server, _("Log &out"), [this] { m_session.LogOut(); });
    server->AppendSeparator();
    add(server, _("&Send jobs ...\tCtrl+J"), [this] { m_transfers->Send(); });
    server->AppendSeparator();
    add(
        server, _("&Quit\tCtrl+Q"), [this] { Close(); }, wxID_EXIT);
    bar->Append(server, _("&Server"));

    auto* const ticket = new wxMenu;
    add(ticket, _("&New ticket ...\tCtrl+T"), [this] { NewTicket(); });
    add(ticket, _("&Delete the ticket"), [this] { DeleteTicket(); });
    ticket->AppendSeparator();
    add(ticket, _("&Export ...\tCtrl+E"), [this] { Export(); });
    add(ticket, _("&Import ...\tCtrl+I"), [this] { Import(); });
    add(ticket, _("&Compare with ...\tCtrl+D"), [this] { Compare(); });
    bar->Append(ticket, _("&Ticket"));

    auto* const edit = new wxMenu;
    add(
        edit, _("&Undo\tCtrl+Z"), [this] { Undo(); }, wxID_UNDO);
    add(
        edit, _("&Redo\tCtrl+Shift+Z"), [this] { Redo(); }, wxID_REDO);
    edit->AppendSeparator();
    add(edit, _("&Edit the value\tF2"), [this] { m_keys->EditChosen(); });
    add(edit, _("&New key ...\tCtrl+N"), [this] { NewKey(); });
    add(edit, _("&Delete the key\tCtrl+Delete"), [this] { DeleteKey(); });
    edit->AppendSeparator();
    add(edit, _("&Search tickets\tCtrl+F"), [this] { m_tickets->FocusSearch(); });
    add(edit, _("&Filter keys\tCtrl+K"), [this] { m_keys->FocusFilter(); });
    bar->Append(edit, _("&Edit"));

    auto* const view = new wxMenu;
    add(view, _("&Open all branches\tCtrl++"), [this] { m_keys->OpenAll(); });
    add(view, _("&Close all branches\tCtrl+-"), [this] { m_keys->CloseAll(); });
    view->AppendSeparator();
    add(view, _("&Events\tCtrl+1"), [this] { m_below->SetSelection(0); });
    add(view, _("&Jobs\tCtrl+2"), [this] { m_below->SetSelection(1); });
    add(view, _("&Pause events\tCtrl+P"), [this] { m_events->TogglePause(); });
    add(view, _("Forget &all events"), [this] { m_events->Clear(); });
    add(view, _("&Forget the jobs that are over"), [this] { m_transfers->Take(m_jobs.RemoveOver()); });
    add(view, _("&Read all anew\tF5"), [this] { m_session.ListAll(); });
    view->AppendSeparator();
    add(view, _("&Next pane\tF6"), [this] { FocusNextPane(); });
    bar->Append(view, _("&View"));
    SetMenuBar(bar);
    Bind(wxEVT_CHAR_HOOK, &MainFrame::TakeKey, this);
}

void MainFrame::Connect()
{
    m_session.onState = [this](DeskSession::State state, comgui::Error const& error) { Take(state, error); };
    m_session.onEvent = [this](comgui::Event const& event) { Take(event); };
    m_session.onProblem = [this](comgui::Error const& error) { Complain(comgui::ToWx(error.Text())); };
    m_session.onList = [this](int type, std::vector<int> const& ids) { TakeList(type, ids); };
    m_session.onTicket = [this](comgui::TicketAddress ticket, bool isThere)
    {
        if (auto const index = isThere ? m_index.Add(ticket) : m_index.Remove(ticket))
            isThere ? m_tickets->Added(ticket, *index) : m_tickets->Removed(ticket, *index);
    };
    m_titles.onAsked = [this] { m_repaint.IsRunning() ? false : m_repaint.StartOnce(RepaintPause); };
    m_titles.onTitles = [this] { m_tickets->TitlesChanged(); };
    m_editor.onWritten = [this](auto ticket, auto const& key)
    { Say(wxString::Format(_("%s %s is written"), NameOf(ticket), comgui::ToWx(DisplayText(key)))); };
    m_editor.onRefused = [this](auto ticket, auto const& key, comgui::Error const& error)
    {
        if (m_live && m_live->Address() == ticket)
            m_keys->Explain(key, comgui::ToWx(error.Text()));
        Say(comgui::ToWx(error.Text()));
    };
    m_editor.onForeign = [this](EditWrite const& foreign) { return IsForeignOverwritten(foreign); };
    m_editor.onHistory = [this]
    {
        GetMenuBar()->Enable(wxID_UNDO, m_editor.CanUndo());
        GetMenuBar()->Enable(wxID_REDO, m_editor.CanRedo());
    };
    m_editor.onHistory();
    m_tickets->onChoose = [this](comgui::TicketAddress ticket) { ShowTicket(ticket); };
    m_tickets->onSearch = [this](std::string const& text) { Search(text); };
    m_keys->onEdit = [this](auto const& key, auto const& text, comgui::Value const* changed)
    { TakeEdit(key, text, changed); };
    m_events->onChoose = [this](comgui::TicketAddress ticket, std::string const& key)
    {
        m_tickets->Choose(ticket);
        m_keys->Choose(key);
    };
    m_transfers->onSend = [this](auto const& files, auto const& options) { Send(files, options); };
    m_transfers->onCancel = [this](JobRow const& row)
    {
        if (auto const sent = m_sent.find(row.transfer.value_or(0)); sent != m_sent.end())
            sent->second.Cancel();
    };
    m_transfers->onOpen = [this](int job) { m_tickets->Choose({comgui::JobTickets, job}); };
    m_transfers->queues = [this] { return Queues(); };
    m_repaint.Bind(wxEVT_TIMER, [this](auto&) { Repaint(); });
}

// The session

void MainFrame::AskForLogin(std::string const& why)
{
    LoginDialog dialog(this, m_session.Connection(), m_session.Worker(), m_settings.Servers(),
                       m_settings.User());
    if (!why.empty())
        dialog.Explain(why);
    if (dialog.ShowModal() == wxID_OK)
        LoggedIn(dialog.Server(), dialog.User().name);
    else
        m_session.LoginFailed();
}

void MainFrame::LogIn(comgui::Server const& server, comgui::Account const& account)
{
    Say(_("Logging in ..."));
    m_session.Worker().Do([this, server, account] { return m_session.Connection().LogIn(server, account); },
                          m_session.InThisSession(
                              [this, server](comgui::Result<comgui::User> const& user) {
                                  user ? LoggedIn(server, user->name) : AskForLogin(user.GetError().Text());
                              }));
}

void MainFrame::LoggedIn(comgui::Server const& server, std::string const& user)
{
    m_settings.Remember(TextOf(server), user);
    m_server = comgui::ToWx(user + " @ " + TextOf(server));
    ForgetTickets();
    m_session.LoggedIn();
    Say(wxString::Format(_("Logged in: %s"), comgui::ToWx(user)));
}

void MainFrame::ForgetTickets()
{
    m_search.reset();
    m_live.reset();
    m_titles.Clear();
    m_editor.Clear();
    m_index.Clear();
    m_jobs.Clear();
    m_sent.clear();
    m_tickets->Clear();
    m_keys->ShowTicket({});
    ShowInks({});
    m_transfers->Take(JobBoard::Change::Rows);
    for (wxWindow* const child : GetChildren())
        if (auto* const comparison = dynamic_cast<CompareFrame*>(child))
            comparison->Destroy();  // would compare tickets of two servers after the next login
}

void MainFrame::Take(DeskSession::State state, comgui::Error const& error)
{
    bool const isIn = state != DeskSession::State::LoggedOut;
    SetTitle(isIn ? m_server + " - " + _("Ticket desk") : _("Ticket desk"));
    m_transfers->Enable(isIn);
    if (!isIn)
    {
        ForgetTickets();
        m_complaint->Dismiss();
        Say(_("Logged out"));
    }
    if (state == DeskSession::State::Lost)
        m_info->ShowMessage(wxString::Format(_("%s. Trying again ..."), ShownText(error.Text())),
                            wxICON_ERROR);
    else
        m_info->Dismiss();
}

void MainFrame::TakeList(int type, std::vector<int> const& ids)
{
    if (!ids.empty() || m_index.Count(type) > 0)
    {
        m_index.Show(type, ids);
        m_tickets->TicketsChanged(type);
    }
    if (type == comgui::QueueTickets)
        (void)Queues();  // so that their names are known when a job is sent
    if (m_first && m_first->type == type)
        ChooseFirst();
}

void MainFrame::ShowFirst(std::string const& ticket)
{
    m_first = TicketFromText(ticket, comgui::JobTickets);
    if (!m_first)
        Complain(comgui::ToWx(DisplayText(ticket)) + ": " + NoTicket());
}

// Now or never: a later listing would take the user away from what he does by then.
void MainFrame::ChooseFirst()
{
    comgui::TicketAddress const ticket = *std::exchange(m_first, std::nullopt);
    if (m_index.IndexOf(ticket))
        m_tickets->Choose(ticket);
    else
        Complain(wxString::Format(_("%s is not there."), NameOf(ticket)));
}

void MainFrame::Take(comgui::Event const& event)
{
    m_events->Take(event);
    m_titles.Take(event);
    std::visit([this](auto const& what) { TakeJobs(what); }, event);
    if (m_search && std::holds_alternative<comgui::ServerBack>(event))
        m_search->GoOn();
    if (!m_repaint.IsRunning())
        m_repaint.StartOnce(RepaintPause);
}

void MainFrame::Repaint()
{
    m_titles.Read();
    m_events->Repaint();
}

void MainFrame::TakeJobs(comgui::TransferProgressed const& event)
{
    m_transfers->Take(m_jobs.Take(event, Now()));
    auto const sent = m_sent.find(event.transfer);
    if (auto const job = sent == m_sent.end() ? std::nullopt : sent->second.Job())
        m_transfers->Take(m_jobs.Identify(event.transfer, *job));
}

void MainFrame::TakeJobs(comgui::TransferEnded const& event)
{
    m_transfers->Take(m_jobs.Take(event, Now()));
    m_sent.erase(event.transfer);
    if (!event.outcome && event.outcome.GetError().code != comgui::Cancelled)
        Say(comgui::ToWx(event.outcome.GetError().Text()));
}

void MainFrame::TakeJobs(comgui::TicketChanged const& event)
{
    if (event.ticket.type != comgui::JobTickets)
        return;
    bool isToBeRead = event.isWhole;
    for (comgui::KeyChange const& change : event.keys)
    {
        m_transfers->Take(m_jobs.TakeJob(event.ticket.id, change, Now()));
        isToBeRead = isToBeRead || (!change.value && JobBoard::IsTold(change.key));
    }
    if (isToBeRead)
        ReadJobs({event.ticket.id});
}

void MainFrame::TakeJobs(comgui::TicketDeleted const& event)
{
    if (event.ticket.type == comgui::JobTickets)
        m_transfers->Take(m_jobs.RemoveJob(event.ticket.id));
}

void MainFrame::TakeJobs(comgui::ManyTicketsChanged const& event)
{
    if (event.type == comgui::JobTickets)
        ReadJobs(m_jobs.Jobs());
}

void MainFrame::TakeJobs(comgui::ServerBack const& event)
{
    if (event.isNewSession)
        ReadJobs(m_jobs.Jobs());
}

// Those of which an event tells no more than that something is different.
void MainFrame::ReadJobs(std::vector<int> const& jobs)
{
    using Read = std::vector<std::pair<int, comgui::Result<comgui::Snapshot>>>;
    auto const read = [tickets = m_session.Tickets(), jobs]
    {
        Read results;
        for (int const job : jobs)
            results.emplace_back(job, tickets.ReadAll({comgui::JobTickets, job}));
        return results;
    };
    m_session.Worker().Do(read,
                          [this](Read const& results)
                          {
                              if (m_session.Now() == DeskSession::State::LoggedOut)
                                  return;
                              for (auto const& [job, ticket] : results)
                                  if (ticket)
                                      m_transfers->Take(m_jobs.TakeJob(job, *ticket, Now()));
                                  else if (ticket.GetError().code == comgui::NoSuchTicket)
                                      m_transfers->Take(m_jobs.RemoveJob(job));
                          });
}

std::vector<JobQueue> MainFrame::Queues()
{
    std::vector<JobQueue> queues;
    for (std::size_t i = 0; i < m_index.Count(comgui::QueueTickets); ++i)
    {
        comgui::TicketAddress const queue = *m_index.At(comgui::QueueTickets, i);
        queues.push_back({queue.id, m_titles.TitleOf(queue)});
    }
    return queues;
}

// Tickets

void MainFrame::ShowTicket(comgui::TicketAddress ticket)
{
    if (m_live && m_live->Address() == ticket)
        return;
    m_keys->ShowTicket(NameOfType(ticket.type) + " " + NameOf(ticket));
    ShowInks({});
    m_events->ShowOnly(ticket);
    m_live.emplace(m_session.Connection(), m_session.Worker(), ticket,
                   [this](comgui::TicketUpdate const& update) { Take(update); });
}

void MainFrame::Take(comgui::TicketUpdate const& update)
{
    if (!update.outcome)
        Say(comgui::ToWx(update.outcome.GetError().Text()));
    m_keys->Take(m_live->Now(), update.differences);
    ShowInks(m_live->Now());
}

void MainFrame::ShowInks(comgui::Snapshot const& ticket)
{
    m_coverage.Take(ticket);
    m_inks->Take(m_coverage);
    bool const hasInks = !m_coverage.Inks().empty();
    if (hasInks && !m_middle->IsSplit())
        m_middle->SplitVertically(m_keys, m_inks, -FromDIP(260));
    else if (!hasInks && m_middle->IsSplit())
        m_middle->Unsplit(m_inks);
}

void MainFrame::NewTicket()
{
    long const type = wxGetNumberFromUser({}, _("Type of the ticket, 0 to 99:"), _("New ticket"),
                                          m_live ? m_live->Address().type : comgui::JobTickets, 0,
                                          comgui::TicketTypes - 1, this);
    if (type < 0)
        return;
    m_session.Worker().Do([tickets = m_session.Tickets(), type]
                          { return tickets.Create(static_cast<int>(type)); },
                          m_session.InThisSession(
                              [this](comgui::Result<comgui::TicketAddress> const& ticket)
                              {
                                  if (!ticket)
                                      return Complain(comgui::ToWx(ticket.GetError().Text()));
                                  m_session.Made(*ticket);
                                  m_tickets->Choose(*ticket);
                              }));
}

void MainFrame::DeleteTicket()
{
    if (!m_live)
        return;
    comgui::TicketAddress const ticket = m_live->Address();
    if (wxMessageBox(
            wxString::Format(_("Delete ticket %s with all its keys? This cannot be undone."), NameOf(ticket)),
            _("Delete the ticket"), wxYES_NO | wxNO_DEFAULT | wxICON_QUESTION, this) != wxYES)
        return;
    m_session.Worker().Do([tickets = m_session.Tickets(), ticket] { return tickets.Delete(ticket); },
                          m_session.InThisSession(
                              [this, ticket](comgui::Outcome const& outcome)
                              {
                                  outcome ? Say(wxString::Format(_("%s is deleted"), NameOf(ticket)))
                                          : Complain(comgui::ToWx(outcome.GetError().Text()));
                              }));
}

void MainFrame::NewKey()
{
    if (!m_live)
        return;
    // While the dialog is open, another ticket may come to be shown, as one that was made meanwhile.
    comgui::TicketAddress const ticket = m_live->Address();
    auto const isThere = [this, ticket, before = m_live->Now()](std::string const& key)
    {
        bool const isShown = m_live && m_live->Address() == ticket;
        return (isShown ? m_live->Now() : before).Find(key) != nullptr;
    };
    NewKeyDialog dialog(this, m_keys->ChosenKey().value_or(""), isThere);
    if (dialog.ShowModal() == wxID_OK)
        m_editor.Write(ticket, dialog.Key(), dialog.Value());
}

// Who types in a field means what he has typed.
void MainFrame::Undo()
{
    if (auto* const field = dynamic_cast<wxTextEntry*>(FindFocus()))
        field->Undo();
    else
        m_editor.Undo();
}

void MainFrame::Redo()
{
    if (auto* const field = dynamic_cast<wxTextEntry*>(FindFocus()))
        field->Redo();
    else
        m_editor.Redo();
}

void MainFrame::DeleteKey()
{
    if (dynamic_cast<wxTextEntry*>(FindFocus()))
        return;
    if (auto const key = m_keys->ChosenKey(); key && m_live)
        m_editor.Write(m_live->Address(), *key, {});
}

void MainFrame::Export()
{
    if (m_live)
        ExportTicket(this, fileQuestions, m_session.Tickets(), m_session.Worker(), m_live->Address(),
                     [this](wxString const& text) { Complain(text); });
}

void MainFrame::Import()
{
    ImportTicket(this, fileQuestions, m_session.Tickets(), m_session.Worker(),
                 m_live ? m_live->Address().type : comgui::JobTickets,
                 m_session.InThisSession(
                     [this](comgui::TicketAddress ticket)
                     {
                         m_session.Made(ticket);
                         m_tickets->Choose(ticket);
                     }),
                 [this](wxString const& text) { Complain(text); });
}

void MainFrame::Compare()
{
    if (!m_live)
        return;
    comgui::TicketAddress const left = m_live->Address();
    wxTextEntryDialog dialog(this, _("The other ticket, by its number or as type/number:"),
                             wxString::Format(_("Compare %s"), NameOf(left)));
    if (dialog.ShowModal() != wxID_OK)
        return;
    auto const right = TicketFromText(comgui::ToUtf8(dialog.GetValue()), left.type);
    if (!right)
        return Complain(NoTicket());
    (new CompareFrame(this, m_session.Connection(), m_session.Worker(), left, *right))->Show();
}

void MainFrame::Search(std::string const& text)
{
    m_search.reset();
    if (text.empty())
        return;
    std::vector<comgui::TicketAddress> all;
    for (int const type : m_index.Types())
        for (std::size_t i = 0; i < m_index.Count(type); ++i)
            all.push_back(*m_index.At(type, i));
    m_tickets->BeginSearch(_("Searching ..."));
    m_search.emplace(m_session.Worker(), m_session.Tickets(), SearchQuery{text}, all,
                     [this](SearchBatch const& batch)
                     {
                         std::vector<comgui::TicketAddress> found;
                         for (SearchMatch const& match : batch.matches)
                             found.push_back(match.ticket);
                         m_tickets->AddFound(found, NoteOf(batch));
                     });
}

void MainFrame::Send(std::vector<std::string> const& files, comgui::JobOptions const& options)
{
    m_below->SetSelection(1);
    for (std::string const& file : files)
    {
        comgui::Transfer const transfer = m_session.Connection().GetTransfers().SendJob(file, options);
        m_transfers->Take(m_jobs.Add(transfer, Now()));
        m_sent.insert_or_assign(transfer.Number(), transfer);
    }
}

void MainFrame::TakeEdit(std::string const& key, std::string const& text, comgui::Value const* changed)
{
    if (!m_live)
        return;
    comgui::TicketAddress const ticket = m_live->Address();
    if (!changed)
        return m_editor.WriteText(ticket, key, text);
    // Behind the end of the edit: a dialog within it would find the editor half gone.
    CallAfter(
        [this, ticket, key, text, present = *changed]
        {
            if (IsOverwritten(_("Edit"), key, present))
                m_editor.WriteText(ticket, key, text);
        });
}

bool MainFrame::IsForeignOverwritten(EditWrite const& foreign)
{
    return IsOverwritten(_("Undo"), foreign.key, foreign.present);
}

bool MainFrame::IsOverwritten(wxString const& title, std::string const& key, comgui::Value const& present)
{
    return wxMessageBox(
               wxString::Format(_("%s has been changed by somebody else since: it is %s now. Overwrite it?"),
                                comgui::ToWx(DisplayText(key)), comgui::ToWx(DisplayTextOf(present))),
               title, wxYES_NO | wxNO_DEFAULT | wxICON_QUESTION, this) == wxYES;
}

// Messages

void MainFrame::Say(wxString const& text) { SetStatusText(text); }

void MainFrame::Complain(wxString const& text)
{
    SetStatusText(text);
    m_complaint->ShowMessage(text, wxICON_INFORMATION);
}

void MainFrame::FocusNextPane()
{
    wxWindow* const panes[] = {m_tickets, m_keys, m_below};
    wxWindow const* const focus = FindFocus();
    auto const* const current = std::find_if(
        std::begin(panes), std::end(panes),
        [focus](wxWindow const* pane) { return focus && pane->IsDescendant(const_cast<wxWindow*>(focus)); });
    std::size_t const next =
        current == std::end(panes) ? 0 : static_cast<std::size_t>(current - panes + 1) % std::size(panes);
    panes[next]->SetFocus();
}

// GTK's lists have uses of their own for Ctrl+F, Ctrl+N and others, and get keys before the menu. Fields keep
// theirs.
void MainFrame::TakeKey(wxKeyEvent& event)
{
    if (!dynamic_cast<wxDataViewCtrl*>(FindFocus()))
        return event.Skip();
    for (std::size_t i = 0; i < GetMenuBar()->GetMenuCount(); ++i)
        for (wxMenuItem const* const item : GetMenuBar()->GetMenu(i)->GetMenuItems())
        {
            std::unique_ptr<wxAcceleratorEntry> const keys(item->GetAccel());
            if (!keys || keys->GetKeyCode() != event.GetKeyCode() ||
                keys->GetFlags() != event.GetModifiers() || !item->IsEnabled())
                continue;
            wxCommandEvent command(wxEVT_MENU, item->GetId());
            ProcessWindowEvent(command);
            return;
        }
    event.Skip();
}

double MainFrame::Now()
{
    return std::chrono::duration<double>(std::chrono::steady_clock::now().time_since_epoch()).count();
}
}  // namespace desk
