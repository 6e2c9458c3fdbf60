#include "bench/site/SoakClient.h"

#include "bench/site/LaneListener.h"
#include "tests/support/Files.h"
#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <csignal>
#include <fcntl.h>
#include <functional>
#include <iostream>
#include <map>
#include <memory>
#include <optional>
#include <poll.h>
#include <random>
#include <sstream>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

namespace
{
using Clock = std::chrono::steady_clock;
using namespace std::chrono_literals;

constexpr int TextType = 64;     // ticket NUMBER + 1
constexpr int VisitorType = 65;  // the same
constexpr int PathType = 66;     // the same
constexpr auto Patience = 60s;   // for what always arrives unless something is wrong

// What one kind of program does. Step() is one thing, after which it may be told to end.
class Work
{
public:
    explicit Work(SoakTask const& task) : m_task(task), m_random(task.seed) {}
    virtual ~Work() = default;
    Work(Work const&) = delete;
    Work& operator=(Work const&) = delete;

    virtual bool Begin() { return LogIn(); }
    virtual void Step() = 0;
    virtual bool IsDone() const { return false; }         // it ends by itself
    virtual void End(std::string const& /*expected*/) {}  // the line that told it to end
    virtual Clock::duration Pause() const { return 2ms; }
    virtual std::int64_t Done() { return ++m_steps; }  // all that has been done

protected:
    bool LogIn()
    {
        m_client.emplace();
        int const code = m_client->LogIn();
        if (code != 0)
            PrintLine("refused login " + std::to_string(code));
        return code == 0;
    }
    // False where the disk of this program is full.
    static bool WriteOwn(std::string const& file, std::string const& content)
    {
        try
        {
            WriteFile(file, content);
            return true;
        }
        catch (std::exception const&)
        {
            Refused("file of its own");
            return false;
        }
    }
    static void Refused(std::string const& what) { PrintLine("refused " + what); }
    unsigned Random(std::size_t below) { return static_cast<unsigned>(m_random() % below); }
    int RandomLane() { return static_cast<int>(Random(static_cast<std::size_t>(m_task.lanes))); }
    TicketName Own(int type) const { return {type, m_task.number + 1}; }
    std::string Name() const { return m_task.kind + "-" + std::to_string(m_task.number); }

    SoakTask const& m_task;
    std::optional<SiteClient> m_client;

private:
    std::mt19937 m_random;
    std::int64_t m_steps = 0;
};

// Reads what the writers write.
class Reader : public Work
{
public:
    using Work::Work;

    void Step() override
    {
        int const lane = RandomLane();
        TicketName const ticket = Random(3) == 0 ? SharedTable : TicketName{TableType, lane + 1};
        auto const table = Random(2) == 0 ? m_client->Table(ticket) : m_client->TableOfXml(ticket);
        if (!SiteClient::IsWhole(table))
            PrintLine("torn table " + std::to_string(ticket.id));
        std::int64_t const counter = m_client->Get({CounterType, lane + 1}, CounterKey).value_or(0);
        if (counter < m_counters[lane])
            PrintLine("lost counter of lane " + std::to_string(lane) + ": " + std::to_string(counter) +
                      " behind " + std::to_string(m_counters[lane]));
        m_counters[lane] = counter;
    }

private:
    std::map<int, std::int64_t> m_counters;
};

// Hears what the writers write; every change once.
class Listener : public Work
{
public:
    using Work::Work;
    ~Listener() override { m_client.reset(); }

    bool Begin() override
    {
        return LogIn() && (m_listener.Listen(*m_client, Types()) || (Refused("callback"), false));
    }
    void Step() override {}
    Clock::duration Pause() const override { return 20ms; }
    std::int64_t Done() override { return m_listener.Changes(); }

    // expected: TYPE LANE COUNT for each type and lane.
    void End(std::string const& expected) override
    {
        std::istringstream words(expected.substr(std::min(expected.find(' '), expected.size())));
        int type = 0;
        int lane = 0;
        std::int64_t count = 0;
        while (words >> type >> lane >> count)
            Await(type, lane, count);
    }

protected:
    static std::vector<int> Types() { return {CounterType, TableType, CreatedType, ListType, JobType}; }

    LaneListener m_listener;

private:
    void Await(int type, int lane, std::int64_t count) const
    {
        auto const deadline = Clock::now() + Patience;
        auto const isHeard = [&]
        {
            auto const heard = m_listener.Heard(type, lane);
            return heard >= count || (heard == 0 && !m_task.isFirst);
        };
        while (!isHeard() && Clock::now() < deadline)
            std::this_thread::sleep_for(5ms);
        if (!isHeard())
            PrintLine("misheard only " + std::to_string(m_listener.Heard(type, lane)) + " of " +
                      std::to_string(count) + " of type " + std::to_string(type) + ", lane " +
                      std::to_string(lane));
    }
};

// The same, but its handler halts now and then, so that more waits for it than the server keeps in memory.
class SlowListener : public Listener
{
public:
    using Listener::Listener;
    ~SlowListener() override { m_client.reset(); }

    bool Begin() override
    {
        if (!LogIn())
            return false;
        bool isEnabled = m_client->Listen(
            [this](Heard const& heard)
            {
                m_listener.Hear(heard);
                if (Clock::now() >= m_nextHalt.load())
                {
                    std::this_thread::sleep_for(20s);
                    m_nextHalt = Clock::now() + 15s;
                }
            });
        for (int const type : Types())
            isEnabled = isEnabled && m_client->Enable(type);
        if (!isEnabled)
            Refused("callback");
        return isEnabled;
    }
    void End(std::string const& expected) override
    {
        m_nextHalt = Clock::time_point::max();
        Listener::End(expected);
    }

    // The halts are no pauses.
    std::int64_t Done() override { return ++m_rounds; }

private:
    std::atomic<Clock::time_point> m_nextHalt = Clock::now() + 3s;
    std::int64_t m_rounds = 0;
};

// Long sessions that read and replace many texts, but not so many that one that was read may go before the
// logout.
class Texts : public Work
{
public:
    using Work::Work;

    bool Begin() override { return LogIn() && ReadAll(); }

    void Step() override
    {
        std::size_t const key = Random(Keys);
        int const version = m_versions[key] + 1;
        if (SiteClient::Manager().SetParameter(TextType, m_task.number + 1, KeyOf(key).c_str(), PARAM_STRING,
                                               TextOf(key, version).c_str(), -1) != 0)
            m_versions[key] = version;
        else
        {
            Refused("text");
            m_client->Create(Own(TextType));
        }
        for (int i = 0; i < 10; ++i)
            Read(Random(Keys));
        if (m_read.size() >= ReadsOfASession)
            NextSession();
    }

private:
    static constexpr std::size_t Keys = 50;
    static constexpr std::size_t ReadsOfASession = 5000;

    struct ReadText
    {
        char const* text;
        std::size_t key;
        int version;
    };

    static std::string KeyOf(std::size_t key) { return "Text/" + std::to_string(key); }
    static std::string TextOf(std::size_t key, int version)
    {
        return std::to_string(version) + " " +
               std::string(key * 16 + static_cast<std::size_t>(version) % 64, 't');
    }

    bool ReadAll()
    {
        m_client->Create(Own(TextType));
        for (std::size_t key = 0; key < Keys; ++key)
            if (char const* const text = Get(key))
                m_versions[key] = std::atoi(text);
        return true;
    }

    char const* Get(std::size_t key) const
    {
        char const* text = nullptr;
        SiteClient::Manager().GetParameter(TextType, m_task.number + 1, KeyOf(key).c_str(), PARAM_STRING,
                                           &text, -1);
        return text;
    }

    void Read(std::size_t key)
    {
        if (char const* const text = Get(key))
            m_read.push_back({text, key, m_versions[key]});
        else if (m_versions[key] > 0)
            PrintLine("lost text " + KeyOf(key));
    }

    void NextSession()
    {
        auto const isOther = [](ReadText const& read) { return read.text != TextOf(read.key, read.version); };
        auto const other = std::find_if(m_read.begin(), m_read.end(), isOther);
        if (other != m_read.end())
            PrintLine("torn text " + KeyOf(other->key) + ": " + std::string(other->text).substr(0, 40));
        m_read.clear();
        m_client.reset();
        while (!LogIn())
            std::this_thread::sleep_for(100ms);
    }

    std::vector<ReadText> m_read;
    std::map<std::size_t, int> m_versions;
};

// Moves a folder of the system ticket, and resolves a path that leans on it.
class Translator : public Work
{
public:
    using Work::Work;

    bool Begin() override
    {
        if (!LogIn())
            return false;
        m_client->Create(Own(PathType));
        std::string const path = std::string("$(") + Variable() + ")/x";
        SiteClient::Manager().SetParameter(PathType, m_task.number + 1, "Path", PARAM_STRING, path.c_str(),
                                           -1);
        return true;
    }

    void Step() override
    {
        std::string const folder = "/soak/" + std::to_string(++m_count);
        std::string const key = std::string("System/Folders/") + (m_task.number == 0 ? "Log" : "Preview");
        if (SiteClient::Manager().SetParameter(0, 0, key.c_str(), PARAM_STRING, folder.c_str(), -1) == 0)
            return Refused("folder");
        for (int i = 0; i < 100; ++i)
        {
            std::string const path = SiteClient::Manager()
                                         .GetwxStringParameter(PathType, m_task.number + 1, "Path", -1)
                                         .utf8_string();
            if (path != folder + "/x")
                return PrintLine("torn path " + path + " instead of " + folder + "/x");
        }
    }
    Clock::duration Pause() const override { return 50ms; }

private:
    char const* Variable() const { return m_task.number == 0 ? "LOG" : "PREVIEW"; }

    int m_count = 0;
};

// Brings files to the server and fetches them, at once or later.
class Carrier : public Work
{
public:
    using Work::Work;
    ~Carrier() override { m_client.reset(); }

    bool Begin() override
    {
        return LogIn() && (m_client->Listen([this](Heard const& heard) { Hear(heard); }) ||
                           (Refused("callback"), false));
    }

    void Step() override
    {
        std::string const source = (m_task.folder / (Name() + ".source")).string();
        std::string const target = (m_task.folder / (Name() + ".target")).string();
        std::string const content((1 + Random(400)) * 1000, static_cast<char>('a' + Random(26)));
        if (!WriteOwn(source, content))
            return;
        int const code = Random(2) == 0 ? SiteClient::PutFile(source, ServerPath()) : PutLater(source);
        if (code != 0)
            return Refused("file to the server: " + std::to_string(code));
        if (int const fetched = SiteClient::GetFile(ServerPath(), target); fetched != 0)
            return Refused("file from the server: " + std::to_string(fetched));
        if (ContentOf(target) != content)
            PrintLine("torn file " + target);
    }
    Clock::duration Pause() const override { return 20ms; }

private:
    std::string ServerPath() const { return "$(TEMP)/" + Name(); }

    int PutLater(std::string const& source)
    {
        std::unique_lock lock(m_lock);
        m_code.reset();
        if (int const code = SiteClient::PutFile(source, ServerPath(), SiteClient::Sync::Later); code != 0)
            return code;
        if (!m_ended.wait_for(lock, Patience, [this] { return m_code.has_value(); }))
            PrintLine("misheard no end of a transfer");
        return m_code.value_or(-1);
    }

    void Hear(Heard const& heard)
    {
        if (heard.kind != Heard::TransferEnded)
            return;
        std::lock_guard const lock(m_lock);
        m_code = heard.ticket.id;
        m_ended.notify_all();
    }

    std::mutex m_lock;
    std::condition_variable m_ended;
    std::optional<int> m_code;  // of the transfer that was asked for
};

// Opens and saves a ticket file; needs no site.
class Editor : public Work
{
public:
    using Work::Work;

    bool Begin() override
    {
        if (!std::filesystem::exists(m_file))
            WriteFile(m_file,
                      "<ticket version=\"1\"><parameter key=\"Saved\" type=\"int\">0</parameter></ticket>");
        m_saved = Saved();
        PrintLine("found " + std::to_string(m_saved));
        return true;
    }

    void Step() override
    {
        SiteClient::Manager().SetParameterToLocal(wxString::FromUTF8(m_file), "Saved", m_saved + 1);
        int const saved = Saved();
        if (saved == m_saved + 1)
            PrintLine("saved " + std::to_string(m_saved = saved));
        else if (saved == m_saved)
            Refused("ticket file");
        else
            PrintLine("torn ticket file: " + std::to_string(saved) + " instead of " +
                      std::to_string(m_saved + 1));
    }
    Clock::duration Pause() const override { return 20ms; }

private:
    int Saved() const
    {
        return SiteClient::Manager().GetIntParameterFromLocal(wxString::FromUTF8(m_file), "Saved", -1, -1);
    }

    std::string const m_file = (m_task.folder / (Name() + ".xml")).string();
    int m_saved = 0;
};

// Opens the site, does a few things, and leaves with a job announced and a file on its way: with a logout,
// without one, or by its death.
class Visitor : public Work
{
public:
    using Work::Work;

    bool IsDone() const override { return m_isDone; }
    void Step() override
    {
        m_isDone = true;
        m_client->Create(Own(VisitorType));
        if (!m_client->Set(Own(VisitorType), "Visit", static_cast<std::int64_t>(m_task.seed)))
            return Refused("visit");
        if (SiteClient::PrepareJob(Name()) < 0)
            return Refused("job");
        std::string const source = (m_task.folder / (Name() + ".source")).string();
        if (!MakeSlowFile(source))
            return Refused("file of its own");
        if (int const code = SiteClient::PutFile(source, "$(TEMP)/" + Name(), SiteClient::Sync::Later);
            code != 0)
            return Refused("file to the server: " + std::to_string(code));
        std::this_thread::sleep_for(std::chrono::milliseconds(Random(20)));
        unsigned const way = Random(3);
        if (way == 0)
            return;
        PrintLine("bye");
        if (way == 1)
            std::exit(0);
        kill(getpid(), SIGKILL);
    }

private:
    // It takes long to carry: many pieces with holes between, which are carried one by one.
    static bool MakeSlowFile(std::string const& name)
    {
        constexpr off_t Pieces = 5000;
        std::string const piece(4096, 'v');
        off_t const size = 2 * Pieces * static_cast<off_t>(piece.size());
        std::error_code error;
        if (std::filesystem::file_size(name, error) == static_cast<std::uintmax_t>(size) && !error)
            return true;
        int const file = open(name.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0600);
        bool isDone = true;
        for (off_t at = 0; at < size && isDone; at += 2 * static_cast<off_t>(piece.size()))
            isDone = pwrite(file, piece.data(), piece.size(), at) == static_cast<ssize_t>(piece.size());
        isDone = isDone && ftruncate(file, size) == 0;
        close(file);
        return isDone;
    }

    bool m_isDone = false;
};

// Forks, and ends or dies while the child lives on. The child may do nothing with the site, and keeps nobody
// from using it.
class Forker : public Work
{
public:
    using Work::Work;

    bool IsDone() const override { return m_isDone; }
    void Step() override
    {
        m_isDone = true;
        m_client->Create(Own(VisitorType));
        pid_t const child = fork();
        if (child == 0)
            BeChild();
        for (int i = 0; i < 50; ++i)
        {
            if (!m_client->Set(Own(VisitorType), "Fork", i))
                Refused("write of a program that has forked");
            std::this_thread::sleep_for(2ms);
        }
        if (Random(2) == 0)
        {
            PrintLine("bye");
            kill(getpid(), SIGKILL);
        }
    }

private:
    [[noreturn]] void BeChild() const
    {
        if (m_client->Get(Own(VisitorType), "Fork") || m_client->Set(Own(VisitorType), "Fork", -1))
            PrintLine("torn site: the child of a fork may use it");
        if (SiteClient().LogIn() == 0)
            PrintLine("torn site: the child of a fork may log in");
        close(STDIN_FILENO);
        close(STDOUT_FILENO);
        std::this_thread::sleep_for(4s);
        _exit(0);
    }

    bool m_isDone = false;
};

template <typename Kind>
std::unique_ptr<Work> Make(SoakTask const& task)
{
    return std::make_unique<Kind>(task);
}

using Maker = std::unique_ptr<Work> (*)(SoakTask const& task);

std::map<std::string, Maker> const& Makers()
{
    static std::map<std::string, Maker> const makers{
        {"reader", Make<Reader>}, {"listener", Make<Listener>},     {"slow-listener", Make<SlowListener>},
        {"texts", Make<Texts>},   {"translator", Make<Translator>}, {"carrier", Make<Carrier>},
        {"editor", Make<Editor>}, {"visitor", Make<Visitor>},       {"forker", Make<Forker>},
    };
    return makers;
}

// A line of the standard input, if there is one or comes within that time; empty at its end.
std::optional<std::string> Told(Clock::duration within)
{
    pollfd input{STDIN_FILENO, POLLIN, 0};
    auto const time = std::chrono::ceil<std::chrono::milliseconds>(within);
    if (poll(&input, 1, static_cast<int>(time.count())) <= 0)
        return std::nullopt;
    std::string line;
    std::getline(std::cin, line);
    return line;
}

void WorkUntilTold(Work& work)
{
    std::int64_t told = 0;
    auto next = Clock::now();
    while (!work.IsDone())
    {
        work.Step();
        std::int64_t const done = work.Done();
        if (done > told && Clock::now() >= next)
        {
            PrintLine("did " + std::to_string(done - std::exchange(told, done)));
            next = Clock::now() + 100ms;
        }
        if (auto const line = Told(work.Pause()))
            return work.End(*line);
    }
}
}  // namespace

std::vector<std::string> SoakKinds()
{
    std::vector<std::string> kinds;
    for (auto const& [kind, maker] : Makers())
        kinds.push_back(kind);
    return kinds;
}

int RunSoakClient(SoakTask const& task)
{
    std::unique_ptr<Work> work = Makers().at(task.kind)(task);
    if (!work->Begin())
        return 1;
    PrintLine("ready");
    WorkUntilTold(*work);
    work.reset();
    PrintLine("bye");
    return 0;
}
