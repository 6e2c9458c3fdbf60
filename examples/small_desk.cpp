// A window on a server's tickets, on the client kit: the way to begin for an author of graphical clients.
//
// Calls that may take long are a worker's. What it has found is handed back to the window's thread, as events
// are, so the window needs no lock.
#include "DeskFrame.h"

#include <algorithm>
#include <iostream>
#include <wx/app.h>
#include <wx/filedlg.h>

using namespace comgui;

class Window : public DeskFrame
{
public:
    explicit Window(DESK_OPTIONS const& options) : DeskFrame(options)
    {
        m_tree->onChoose = [this](TicketAddress ticket) { Follow(ticket); };
        m_grid->onEdit = [this](auto const& key, auto const& text) { Write(key, text); };
        m_send->Bind(wxEVT_BUTTON, [this](auto&) { SendJob(); });
        m_cancel->Bind(wxEVT_BUTTON, [this](auto&) { m_job->Cancel(); });
        m_listing.Bind(wxEVT_TIMER, [this](auto&) { ShowTickets(); });
        // Before the login: the interest lasts through logins and losses of the server.
        Interest interest = Interest::InAllTypes();
        interest.transfers = true;
        m_events = m_connection.Subscribe(std::move(interest), m_here,
                                          [this](Event const& event)
                                          { std::visit([this](auto const& what) { Take(what); }, event); });
        CallAfter([this] { m_options.account.password.empty() ? AskForAccount("") : LogIn(); });
    }

private:
    template <typename T>
    bool IsGood(Result<T> const& result)
    {
        if (!result)
            Say(result.GetError().Text());
        return result.IsGood();
    }

    void AskForAccount(std::string const& why)
    {
        auto const account = Ask(why, m_options.account);
        if (!account)
            return static_cast<void>(Close());
        m_options.account = *account;
        LogIn();
    }
    void LogIn()
    {
        Say("Logging in ...");
        m_worker.Do([this, options = m_options]
                    { return m_connection.LogIn(options.server, options.account); },
                    [this](Result<User> const& user)
                    {
                        if (!IsGood(user))
                            return AskForAccount(user.GetError().Text());
                        Say("Logged in: " + user->name);
                        ShowTickets();
                    });
    }

    void ShowTickets()
    {
        auto const read = [tickets = m_tickets]
        {
            std::vector<TicketAddress> all;
            for (int const type : tickets.Types().ValueOr({}))
                for (TicketAddress const ticket : tickets.List(type).ValueOr({}))
                    all.push_back(ticket);
            return all;
        };
        m_worker.Do(read,
                    [this](std::vector<TicketAddress> const& all)
                    {
                        m_tree->ShowTickets(all, m_live ? m_live->Address() : TicketAddress());
                        Trace("Tickets: " + std::to_string(all.size()));
                    });
    }
    void Follow(TicketAddress ticket)
    {
        if (m_live && m_live->Address() == ticket)
            return;
        m_grid->Clear();
        m_live.emplace(m_connection, m_worker, ticket,
                       [this](TicketUpdate const& update)
                       {
                           if (IsGood(update.outcome) && update.differences.empty())
                               Say("The ticket is empty");
                           for (SnapshotDifference const& difference : update.differences)
                           {
                               Value const value = difference.after.value_or(Value());
                               m_grid->Set(difference.key, value);
                               Trace(difference.key + " = " + ToText(value));
                           }
                       });
    }
    void Write(std::string const& key, std::string const& text)
    {
        m_worker.Do([tickets = m_tickets, ticket = m_live->Address(), key, text]
                    { return tickets.WriteText(ticket, key, text); },
                    [this](Outcome const& outcome) { IsGood(outcome) ? Say("Written") : void(); });
    }
    void SendJob()
    {
        std::string const file = ToUtf8(wxFileSelector("Send a job"));
        if (file.empty())
            return;
        m_job = m_connection.GetTransfers().SendJob(file);
        m_send->Disable();
        m_cancel->Enable();
    }

    // Events. Tickets that come and go are listed anew, but many at once.
    void Take(TicketCreated) { m_listing.StartOnce(200); }
    void Take(TicketDeleted) { m_listing.StartOnce(200); }
    void Take(ManyTicketsChanged) { m_listing.StartOnce(200); }
    void Take(TicketChanged const&) {}  // that of the live ticket comes to it
    void Take(TransferProgressed const& transfer)
    {
        long long const total = std::max(transfer.progress.total.value_or(1), 1LL);
        m_gauge->SetValue(static_cast<int>(100 * transfer.progress.done / total));
    }
    void Take(TransferEnded const& transfer)
    {
        m_cancel->Disable();
        m_send->Enable();
        m_gauge->SetValue(0);
        if (IsGood(transfer.outcome))
            Say("Sent: job " + std::to_string(transfer.job.value_or(0)));
    }
    void Take(ServerLost const& loss) { Say(loss.error.Text()); }
    void Take(ServerBack)
    {
        Say("The server is back");
        ShowTickets();
    }

    Executor const m_here = OnThreadOf(*this);
    Connection m_connection;
    Tickets const m_tickets = m_connection.GetTickets();
    Worker const m_worker{m_here};
    Subscription m_events;
    std::optional<LiveTicket> m_live;  // that is shown
    std::optional<Transfer> m_job;
    wxTimer m_listing;
};

class SmallDesk : public wxApp
{
public:
    bool OnInit() override
    {
        wxCmdLineParser parser(argc, argv);
        DESK_OPTIONS::AddTo(parser);
        auto const options = DESK_OPTIONS::Take(parser);
        return options && (new Window(*options))->Show();
    }
};

wxIMPLEMENT_APP_NO_MAIN(SmallDesk);

int main(int argc, char** argv)
{
    wxCmdLineParser parser(argc, argv);
    DESK_OPTIONS::AddTo(parser);
    if (argc != 2 || std::string(argv[1]) != "--help")
        return wxEntry(argc, argv);
    std::cout << ToUtf8(parser.GetUsageString());  // needs no display
    return 0;
}
