// A client of a site, driven by commands: reads them from its standard input, one a line, and
// writes one line of answer to each. Between the answers come lines that begin with "event", once it has been
// told to watch. It ends with its input. Tests start as many of it as they want, to see what programs notice
// of each other.
//
// Values are whole numbers. TICKET is TYPE/ID.
#include "tests/support/SiteClient.h"
#include "tests/support/TestSite.h"

#include <chrono>
#include <cstring>
#include <iostream>
#include <map>
#include <sstream>
#include <unistd.h>

namespace
{
constexpr char Help[] = R"(Works on the site that COMGUI_SITE names, as the lines on its standard input say:
  login                             the plug-in's code, 0 for success
  get TICKET KEY                    the value, or none
  state JOB                         the state of a job, or none
  list TICKET KEY                   all values of the key
  set TICKET KEY VALUE              1, or 0 if refused; likewise:
  append TICKET KEY FIRST COUNT     how many of the COUNT values from FIRST on were appended, one a call
  remove TICKET KEY
  make TICKET
  create TYPE COUNT                 the ids of COUNT new tickets, as the server gave them
  ids TYPE                          those that there are
  delete TYPE FIRST LAST            the ids, of those, that it has deleted
  open TICKET                       keeps the ticket's table for
  write KEY VALUE                   which writes through it
  stream TICKET KEY MILLISECONDS    writes 1, 2, 3 ...: how many, and the longest time that a write took, in us
  table TICKET VALUE                writes a table, all of one value
  tables TICKET MILLISECONDS        writes tables of 1, 2, 3 ...: how many
  look TICKET MILLISECONDS          reads tables: how many, how many of another value than before, how many torn
  watch TYPE                        from now on each change of such a ticket is a line:
                                    event changed|created|deleted TICKET [KEY=VALUE...]
  prepare NAME                      the id of the job
  send PATH NAME                    the plug-in's code; likewise:
  put PATH SERVERPATH               does not wait for the end
)";

using Clock = std::chrono::steady_clock;

// A line leaves as a whole, whichever thread writes it, and is in the pipe when this returns.
void Print(std::string line)
{
    line += '\n';
    for (std::size_t done = 0; done < line.size();)
    {
        ssize_t const size = write(STDOUT_FILENO, line.data() + done, line.size() - done);
        if (size < 0)
            _exit(1);  // nobody listens any more
        done += static_cast<std::size_t>(size);
    }
}

std::string TextOf(TicketName ticket)
{
    return std::to_string(ticket.type) + "/" + std::to_string(ticket.id);
}

std::string TextOf(SETMULTIPAR const& record)
{
    std::string text = std::string(record.key) + "=";
    if (record.type == PARAM_NONE)
        return text + "none";
    if (record.type == PARAM_INT64)
        return text + std::to_string(*static_cast<long long const*>(record.value));
    if (record.type == PARAM_INT)
        return text + std::to_string(*static_cast<int const*>(record.value));
    return text + "?";
}

std::string TextOf(Heard const& heard)
{
    std::string text = heard.kind == Heard::Changed         ? "event changed "
                       : heard.kind == Heard::Created       ? "event created "
                       : heard.kind == Heard::Deleted       ? "event deleted "
                       : heard.kind == Heard::TransferEnded ? "event ended "
                                                            : "event ? ";
    text += TextOf(heard.ticket);
    for (SETMULTIPAR const* record = heard.records; record && record->key; ++record)
        text += " " + TextOf(*record);
    return text;
}

template <typename Numbers>
std::string TextOf(Numbers const& numbers)
{
    std::string text;
    for (auto const number : numbers)
        text += (text.empty() ? "" : " ") + std::to_string(number);
    return text;
}

// The words of a command, taken one by one. Throws on a word that is not there.
class Words
{
public:
    explicit Words(std::string const& line) : m_line(line) {}

    std::string Text()
    {
        std::string word;
        if (!(m_line >> word))
            throw std::invalid_argument("too few words");
        return word;
    }
    std::int64_t Number() { return std::stoll(Text()); }
    int Int() { return static_cast<int>(Number()); }
    TicketName Ticket()
    {
        std::string const word = Text();
        return {std::stoi(word), std::stoi(word.substr(word.find('/') + 1))};
    }
    Clock::time_point End() { return Clock::now() + std::chrono::milliseconds(Number()); }

private:
    std::istringstream m_line;
};

class Worker
{
public:
    std::string Answer(std::string const& line)
    {
        Words words(line);
        auto const command = Commands().find(words.Text());
        if (command == Commands().end())
            throw std::invalid_argument("no such command");
        if (m_isLoggedIn && AreSitesInDatabases())
            HearWhatOthersHaveDone();
        return (this->*command->second)(words);
    }

private:
    using Command = std::string (Worker::*)(Words& words);

    static std::map<std::string, Command> const& Commands();

    static std::string Yes(bool isDone) { return isDone ? "1" : "0"; }
    static std::string Value(std::optional<std::int64_t> value)
    {
        return value ? std::to_string(*value) : "none";
    }

    std::string LogIn(Words&)
    {
        int const code = m_client.LogIn();
        m_isLoggedIn = code == 0;
        return std::to_string(code);
    }

    // In a folder everybody sees at once what was acknowledged to anybody. In a database that takes a moment;
    // but whoever has written something has heard of everything before it.
    void HearWhatOthersHaveDone()
    {
        constexpr int OwnType = 89;
        TicketName const own{OwnType, static_cast<int>(getpid())};
        m_client.Create(own);
        m_client.Set(own, "Commands", ++m_commands);
    }

    std::string Get(Words& words)
    {
        TicketName const ticket = words.Ticket();
        return Value(m_client.Get(ticket, words.Text().c_str()));
    }

    std::string State(Words& words)
    {
        auto const state = SiteClient::StateOfJob(words.Int());
        return state ? std::to_string(*state) : "none";
    }

    std::string List(Words& words)
    {
        TicketName const ticket = words.Ticket();
        return TextOf(m_client.List(ticket, words.Text().c_str()));
    }

    std::string Set(Words& words)
    {
        TicketName const ticket = words.Ticket();
        std::string const key = words.Text();
        return Yes(m_client.Set(ticket, key.c_str(), words.Number()));
    }

    std::string Append(Words& words)
    {
        TicketName const ticket = words.Ticket();
        std::string const key = words.Text();
        std::int64_t const first = words.Number();
        std::int64_t const count = words.Number();
        int appended = 0;
        for (std::int64_t value = first; value < first + count; ++value)
            appended += m_client.Set(ticket, key.c_str(), value, -2) ? 1 : 0;
        return std::to_string(appended);
    }

    std::string Remove(Words& words)
    {
        TicketName const ticket = words.Ticket();
        return Yes(m_client.Remove(ticket, words.Text().c_str()));
    }

    std::string Make(Words& words) { return Yes(m_client.Create(words.Ticket())); }

    std::string Create(Words& words)
    {
        int const type = words.Int();
        std::vector<int> ids;
        for (std::int64_t count = words.Number(); count > 0; --count)
            ids.push_back(m_client.CreateNext(type).value_or(-1));
        return TextOf(ids);
    }

    std::string Ids(Words& words) { return TextOf(m_client.Ids(words.Int())); }

    std::string Delete(Words& words)
    {
        int const type = words.Int();
        int const first = words.Int();
        int const last = words.Int();
        std::vector<int> deleted;
        for (int id = first; id <= last; ++id)
            if (m_client.Delete({type, id}))
                deleted.push_back(id);
        return TextOf(deleted);
    }

    std::string Open(Words& words)
    {
        m_open = m_client.Open(words.Ticket());
        return Yes(m_open != nullptr);
    }

    std::string Write(Words& words)
    {
        std::string const key = words.Text();
        long long const value = words.Number();
        return Yes(m_open &&
                   m_open->SSETPARAMETER(m_open->Instance, key.c_str(), PARAM_INT64, &value, -1) != 0);
    }

    std::string Stream(Words& words)
    {
        TicketName const ticket = words.Ticket();
        std::string const key = words.Text();
        Clock::time_point const end = words.End();
        std::int64_t written = 0;
        auto longest = Clock::duration::zero();
        for (Clock::time_point before = Clock::now(); before < end;)
        {
            if (!m_client.Set(ticket, key.c_str(), written + 1))
                return "refused";
            ++written;
            Clock::time_point const after = Clock::now();
            longest = std::max(longest, after - before);
            before = after;
        }
        return std::to_string(written) + " " +
               std::to_string(std::chrono::duration_cast<std::chrono::microseconds>(longest).count());
    }

    std::string Table(Words& words)
    {
        TicketName const ticket = words.Ticket();
        return Yes(m_client.SetTable(ticket, words.Number()));
    }

    std::string Tables(Words& words)
    {
        TicketName const ticket = words.Ticket();
        Clock::time_point const end = words.End();
        std::int64_t written = 0;
        while (Clock::now() < end && m_client.SetTable(ticket, written + 1))
            ++written;
        return std::to_string(written);
    }

    std::string Look(Words& words)
    {
        TicketName const ticket = words.Ticket();
        Clock::time_point const end = words.End();
        int reads = 0;
        int different = 0;
        int torn = 0;
        std::int64_t before = 0;
        for (; Clock::now() < end; ++reads)
        {
            auto const table = reads % 2 == 0 ? m_client.Table(ticket) : m_client.TableOfXml(ticket);
            torn += SiteClient::IsWhole(table) ? 0 : 1;
            std::int64_t const value = table.empty() ? 0 : table.front();
            different += value != before ? 1 : 0;
            before = value;
        }
        return std::to_string(reads) + " " + std::to_string(different) + " " + std::to_string(torn);
    }

    std::string Watch(Words& words)
    {
        if (!m_isListening)
            m_isListening = m_client.Listen([](Heard const& heard) { Print(TextOf(heard)); });
        return Yes(m_isListening && m_client.Enable(words.Int()));
    }

    std::string Prepare(Words& words) { return std::to_string(SiteClient::PrepareJob(words.Text())); }

    std::string Send(Words& words)
    {
        std::string const path = words.Text();
        return std::to_string(SiteClient::SendJob(path, words.Text()));
    }

    std::string Put(Words& words)
    {
        std::string const source = words.Text();
        return std::to_string(SiteClient::PutFile(source, words.Text(), SiteClient::Sync::Later));
    }

    bool m_isLoggedIn = false;
    std::int64_t m_commands = 0;
    SiteClient m_client;
    STICKET_ACCESS const* m_open = nullptr;
    bool m_isListening = false;
};

std::map<std::string, Worker::Command> const& Worker::Commands()
{
    static std::map<std::string, Command> const commands{
        {"login", &Worker::LogIn},     {"get", &Worker::Get},       {"state", &Worker::State},
        {"list", &Worker::List},       {"set", &Worker::Set},       {"append", &Worker::Append},
        {"remove", &Worker::Remove},   {"make", &Worker::Make},     {"create", &Worker::Create},
        {"ids", &Worker::Ids},         {"delete", &Worker::Delete}, {"open", &Worker::Open},
        {"write", &Worker::Write},     {"stream", &Worker::Stream}, {"table", &Worker::Table},
        {"tables", &Worker::Tables},   {"look", &Worker::Look},     {"watch", &Worker::Watch},
        {"prepare", &Worker::Prepare}, {"send", &Worker::Send},     {"put", &Worker::Put}};
    return commands;
}
}  // namespace

int main(int argc, char** argv)
{
    if (argc > 1)
    {
        bool const isAsked = std::strcmp(argv[1], "--help") == 0;
        (isAsked ? std::cout : std::cerr) << (isAsked ? Help : "site_client: takes no arguments\n");
        return isAsked ? 0 : 2;
    }
    Worker worker;
    for (std::string line; std::getline(std::cin, line);)
        try
        {
            Print(worker.Answer(line));
        }
        catch (std::exception const& error)
        {
            Print("error: " + line + ": " + error.what());
        }
    return 0;
}
