// A window on a server's tickets, on the client kit: the way to begin for an author of graphical clients.
//
// Two threads: the window's, and a worker's for calls that may take long. What the worker has found is handed
// back to the window's thread, as events are, so the window needs no lock.
#include "DeskFrame.h"

#include <algorithm>
#include <iostream>
#include <thread>
#include <wx/app.h>
#include <wx/filedlg.h>

using namespace comgui;

class Window : public DeskFrame
{
public:
    explicit Window(DESK_OPTIONS const& options) : DeskFrame(options)
    {
        m_tree->onChoose = [this](TicketAddress ticket) { ShowTicket(ticket); };
        m_grid->onEdit = [this](auto const& key, auto const& text) { Write(key, text); };
        m_send->Bind(wxEVT_BUTTON, [this](auto&) { SendJob(); });
        m_cancel->Bind(wxEVT_BUTTON, [this](auto&) { m_job->Cancel(); });
        m_listing.Bind(wxEVT_TIMER, [this](auto&) { ShowTickets(); });
        // Before the login: the interest lasts through logins and losses of the server.
        Interest interest = Interest::InTypes(
            {SystemTickets, DeviceTickets, JobTickets, QueueTickets, PaperTickets, UserTickets});
        interest.transfers = true;
        m_events = m_connection.Subscribe(std::move(interest), m_here,
                                          [this](Event const& event)
                                          { std::visit([this](auto const& what) { Take(what); }, event); });
        CallAfter([this] { m_options.account.password.empty() ? AskForAccount("") : LogIn(); });
    }
    ~Window() override
    {
        m_queue.Stop();
        m_worker.join();
    }

private:
    // The worker does the work, then the window takes its result.
    template <typename Work, typename Then>
    void Do(Work work, Then then)
    {
        m_queue.GetExecutor()([this, work, then] { m_here([then, result = work()] { then(result); }); });
    }
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
        Do([this, options = m_options] { return m_connection.LogIn(options.server, options.account); },
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
        Do(read, [this](std::vector<TicketAddress> const& all) { m_tree->ShowTickets(all, m_ticket); });
    }
    // What comes while the ticket is read may be newer than what was read, so it waits.
    void ShowTicket(TicketAddress ticket)
    {
        m_ticket = ticket;
        m_late.emplace();
        int const number = ++m_readings;
        Do([tickets = m_tickets, ticket] { return tickets.ReadAll(ticket, Paths::AsStored); },
           [this, number](Result<Snapshot> const& snapshot)
           {
               if (number != m_readings)
                   return;  // a later one is on its way
               m_grid->ShowTicket(IsGood(snapshot) ? *snapshot : Snapshot());
               Trace("The ticket is shown");
               auto const late = std::exchange(m_late, std::nullopt);
               for (TicketChanged const& change : *late)
                   Take(change);
           });
    }
    void Write(std::string const& key, std::string const& text)
    {
        Do([tickets = m_tickets, ticket = m_ticket, key, text]
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
    void Take(TicketChanged const& change)
    {
        if (change.ticket != m_ticket)
            return;
        if (m_late)
            return m_late->push_back(change);
        bool isPartial = change.isWhole;
        for (auto const& [key, value] : change.keys)
        {
            isPartial = isPartial || !value;
            if (value)
                m_grid->Set(key, *value);
            Trace(key + " = " + ToText(value.value_or(Value())));
        }
        if (isPartial)
            ShowTicket(m_ticket);
    }
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
    Subscription m_events;
    int m_readings = 0;
    TicketAddress m_ticket{};                          // that is shown
    std::optional<std::vector<TicketChanged>> m_late;  // while it is read
    std::optional<Transfer> m_job;
    wxTimer m_listing;
    TaskQueue m_queue;
    std::thread m_worker{[this] { m_queue.Run(); }};
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
