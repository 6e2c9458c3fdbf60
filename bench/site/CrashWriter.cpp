#include "bench/site/CrashWriter.h"

#include "bench/site/LaneListener.h"
#include <fstream>
#include <map>
#include <random>
#include <sstream>
#include <sys/mman.h>
#include <thread>
#include <unistd.h>

namespace
{
constexpr char LaneKey[] = "Lane";

// The jobs of a lane have numbers from 1 up; the number says what the file holds.
std::string JobPrefix(int lane) { return "lane-" + std::to_string(lane) + "-"; }
std::size_t JobSize(int number) { return 1000 + static_cast<std::size_t>(number) % 100 * 1000; }
char JobByte(int number) { return static_cast<char>('a' + number % 26); }

bool IsFileOfJob(std::string const& path, int number)
{
    std::ifstream file(path, std::ios::binary);
    std::string const content(std::istreambuf_iterator<char>(file), {});
    return content == std::string(JobSize(number), JobByte(number));
}

// A file that no other program sees, and that goes with this one.
class PrivateFile
{
public:
    explicit PrivateFile(std::string const& content) : m_file(memfd_create("job", MFD_CLOEXEC))
    {
        m_isWhole = write(m_file, content.data(), content.size()) == static_cast<ssize_t>(content.size());
    }
    ~PrivateFile() { close(m_file); }
    PrivateFile(PrivateFile const&) = delete;
    PrivateFile& operator=(PrivateFile const&) = delete;

    bool IsWhole() const { return m_isWhole; }
    std::string Path() const { return "/proc/self/fd/" + std::to_string(m_file); }

private:
    int m_file;
    bool m_isWhole;
};

std::string JobText(int id, char const* key)
{
    return SiteClient::Manager().GetwxStringParameter(JobType, id, key, -1).utf8_string();
}

struct Job
{
    int id;
    std::string path;
};

// Those of a lane that have arrived, by number; one without its whole file is told.
std::map<int, Job> JobsOf(SiteClient const& client, int lane)
{
    std::string const prefix = JobPrefix(lane);
    std::map<int, Job> jobs;
    for (int const id : client.Ids(JobType))
    {
        std::string const name = JobText(id, "Job/Identification/Name");
        if (!name.starts_with(prefix) || SiteClient::StateOfJob(id) != 1)
            continue;
        int const number = std::stoi(name.substr(prefix.size()));
        jobs[number] = {id, JobText(id, "Job/File")};
        if (!IsFileOfJob(jobs[number].path, number))
            PrintLine("torn job " + name);
    }
    return jobs;
}

// What a program finds of a lane. block: where to begin to look for the lane's last number in the list.
std::string Found(SiteClient const& client, int lane, int block)
{
    std::int64_t appended = 0;
    SharedList(client, ListType)
        .Walk(block,
              [&](std::int64_t value)
              {
                  if (LaneOf(value) == lane)
                      appended = CountOf(value);
              });
    auto const table = client.Table({TableType, lane + 1});
    std::ostringstream line;
    line << "found " << client.Get({CounterType, lane + 1}, CounterKey).value_or(0) << ' '
         << (table.empty() ? 0 : table.front()) << ' ' << appended;
    for (int const id : client.Ids(CreatedType))
        if (client.Get({CreatedType, id}, LaneKey) == lane)
            line << ' ' << id;
    line << " jobs";
    for (auto const& [number, job] : JobsOf(client, lane))
        line << ' ' << number;
    return line.str();
}

class Writer
{
public:
    explicit Writer(CrashTask const& task)
        : m_lane(task.lane), m_lanes(task.lanes), m_pause(task.pause), m_list(m_client, ListType, task.block),
          m_random(task.seed)
    {
    }

    int Work()
    {
        if (int const code = m_client.LogIn(); code != 0)
        {
            PrintLine("refused login " + std::to_string(code));
            return 1;
        }
        Begin();
        for (;;)
        {
            Step();
            if (m_pause.count() > 0)
                std::this_thread::sleep_for(m_pause);
        }
    }

private:
    void Begin()
    {
        std::string const found = Found(m_client, m_lane, m_list.Block());
        std::istringstream numbers(found.substr(found.find(' ')));
        numbers >> m_counter >> m_table >> m_appended;
        m_tickets.assign(std::istream_iterator<int>(numbers), {});
        for (auto const& [number, job] : JobsOf(m_client, m_lane))
            m_jobs.push_back(number);
        PrintLine(found);
        MakeTickets();
        if (!m_listener.Listen(m_client, {CounterType}))
            PrintLine("refused callback");
    }

    void MakeTickets()
    {
        m_client.Create({CounterType, m_lane + 1});
        m_client.Create({TableType, m_lane + 1});
        m_client.Create(SharedTable);
    }

    void Step()
    {
        if (m_random() % 32 == 0)  // flushes the disk, so it is rare
            return m_jobs.size() < MostJobs ? SendJob() : DropJob();
        switch (m_random() % 8)
        {
        case 0:
            return WriteTable();
        case 1:
            Report("", m_client.SetTable(SharedTable, static_cast<std::int64_t>(m_random() >> 1)));
            return;
        case 2:
            return Append();
        case 3:
            return m_tickets.size() < MostTickets ? CreateTicket() : DeleteTicket();
        case 4:
            return LookAt({TableType, static_cast<int>(m_random() % static_cast<unsigned>(m_lanes)) + 1});
        case 5:
            return LookAt(SharedTable);
        default:
            return Count();
        }
    }

    // what: the report of a change that was done, nothing for one that is nobody's. What was refused may lack
    // its ticket.
    bool Report(std::string const& what, bool isDone)
    {
        if (!isDone)
        {
            PrintLine("refused " + what);
            MakeTickets();
        }
        else if (!what.empty())
            PrintLine(what);
        return isDone;
    }

    void Count()
    {
        bool const isDone = m_client.Set({CounterType, m_lane + 1}, CounterKey, m_counter + 1);
        m_counter += Report("counter " + std::to_string(m_counter + 1), isDone) ? 1 : 0;
    }

    void WriteTable()
    {
        bool const isDone = m_client.SetTable({TableType, m_lane + 1}, m_table + 1);
        m_table += Report("table " + std::to_string(m_table + 1), isDone) ? 1 : 0;
    }

    void Append()
    {
        bool const isDone = m_list.Append((std::int64_t{m_lane} << LaneShift) + m_appended + 1);
        std::string const block = std::to_string(m_list.Block());
        m_appended += Report("append " + std::to_string(m_appended + 1) + " " + block, isDone) ? 1 : 0;
    }

    void CreateTicket()
    {
        auto const id = m_client.CreateNext(CreatedType);
        bool const isDone = id && m_client.Set({CreatedType, *id}, LaneKey, m_lane);
        if (Report("create " + std::to_string(id.value_or(0)), isDone))
            m_tickets.push_back(*id);
    }

    void DeleteTicket()
    {
        bool const isDone = m_client.Delete({CreatedType, m_tickets.front()});
        if (Report("delete " + std::to_string(m_tickets.front()), isDone))
            m_tickets.erase(m_tickets.begin());
    }

    // Half of the jobs are announced before.
    void SendJob()
    {
        int const number = m_jobs.empty() ? 1 : m_jobs.back() + 1;
        std::string const name = JobPrefix(m_lane) + std::to_string(number);
        PrivateFile const file(std::string(JobSize(number), JobByte(number)));
        bool const isPrepared = file.IsWhole() && (m_random() % 2 == 0 || SiteClient::PrepareJob(name) >= 0);
        bool const isDone = isPrepared && SiteClient::SendJob(file.Path(), name) == 0;
        if (Report("send " + std::to_string(number), isDone))
            m_jobs.push_back(number);
    }

    void DropJob()
    {
        int const number = m_jobs.front();
        auto const jobs = JobsOf(m_client, m_lane);
        auto const job = jobs.find(number);
        if (job == jobs.end())
            return PrintLine("lost job " + std::to_string(number) + " of the lane");
        if (!Report("drop " + std::to_string(number), m_client.Delete({JobType, job->second.id})))
            return;
        m_jobs.erase(m_jobs.begin());
        if (std::filesystem::exists(job->second.path))
            PrintLine("torn job " + std::to_string(number) + " is deleted, but has its file");
    }

    void LookAt(TicketName ticket) const
    {
        auto const table = m_random() % 2 == 0 ? m_client.Table(ticket) : m_client.TableOfXml(ticket);
        if (!SiteClient::IsWhole(table))
            PrintLine("torn table " + std::to_string(ticket.id));
    }

    int const m_lane;
    int const m_lanes;
    std::chrono::microseconds const m_pause;
    LaneListener m_listener;
    SiteClient m_client;  // does not outlive what hears for it
    SharedList m_list;
    std::mt19937 mutable m_random;
    std::int64_t m_counter = 0;
    std::int64_t m_table = 0;
    std::int64_t m_appended = 0;
    std::vector<int> m_tickets;  // the oldest first
    std::vector<int> m_jobs;     // the same
};
}  // namespace

int WriteUntilKilled(CrashTask const& task) { return Writer(task).Work(); }

int CheckLanes(int lanes)
{
    SiteClient client;
    if (int const code = client.LogIn(); code != 0)
    {
        PrintLine("refused login " + std::to_string(code));
        return 1;
    }
    for (int lane = 0; lane < lanes; ++lane)
        PrintLine(Found(client, lane, 1));
    std::map<int, std::int64_t> last;
    SharedList(client, ListType)
        .Walk(1,
              [&](std::int64_t value)
              {
                  std::int64_t const number = CountOf(value);
                  std::int64_t& before = last[LaneOf(value)];
                  if (number != before + 1)
                      PrintLine("disordered " + std::to_string(number) + " of lane " +
                                std::to_string(LaneOf(value)) + " behind " + std::to_string(before));
                  before = number;
              });
    PrintLine("done");
    return 0;
}
