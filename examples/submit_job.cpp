// Sends files to a server as print jobs: announces each one, uploads it, shows how far it has come, waits
// until the server says that the job is in, and prints its ticket.
#include "ServerSession.h"
#include "Shown.h"

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <climits>
#include <condition_variable>
#include <csignal>
#include <cstdio>
#include <cstring>
#include <mutex>
#include <optional>
#include <string>
#include <sys/stat.h>
#include <unistd.h>
#include <vector>
#include <wx/init.h>

char const ProgramName[] = "submit_job";

namespace
{
constexpr int JobType = 3;
constexpr int QueueType = 7;
constexpr int ParameterChange = 1;  // the kind of such a notification
constexpr int JobIsIn = 1;          // "Job/State" of a job whose file is there
constexpr char const* EveryKey[] = {nullptr};
constexpr std::chrono::seconds EventsArriveWithin(10);

struct OPTIONS
{
    SERVER server;
    int copies = 0;                  // 0: the job's ticket says nothing of copies
    int queue = 0;                   // id of the queue's ticket; 0: none
    std::vector<std::string> files;  // UTF-8
};

// Nothing, or the status with which to end at once: after --help, or after a message on a wrong command line.
std::optional<int> Parse(int argc, char** argv, OPTIONS& options)
{
    // Paths are UTF-8 whatever the locale says; what is none is looked for as it would look in Latin-1.
    std::vector<std::wstring> texts(static_cast<std::size_t>(argc));
    std::vector<wchar_t*> arguments(texts.size());
    for (std::size_t i = 0; i < texts.size(); ++i)
    {
        wxString const text = wxString::FromUTF8(argv[i]);
        texts[i] = (text.empty() ? wxString(argv[i], wxConvISO8859_1) : text).ToStdWstring();
        arguments[i] = texts[i].data();
    }

    wxCmdLineParser parser(argc, arguments.data());
    parser.SetLogo("Sends files to a server as print jobs.\n"
                   "Exit status: 0 all of them are there; 1 one is not, or there is no such queue; 2 a wrong "
                   "command line,\nno server, no login, or the output cannot be written.");
    parser.AddSwitch("h", "help", "show this text", wxCMD_LINE_OPTION_HELP);
    SERVER::AddOptions(parser);
    parser.AddOption("c", "copies", "print so many copies (0: as the server sees fit)");
    parser.AddOption("q", "queue", "put the jobs into the queue of that number (0: into none)");
    parser.AddParam("FILE", wxCMD_LINE_VAL_STRING, wxCMD_LINE_PARAM_MULTIPLE);
    if (auto const status = ParseCommandLine(parser))
        return status;
    if (!options.server.TakeOptions(parser) || !TakeNumber(parser, "copies", options.copies, 0, INT_MAX) ||
        !TakeNumber(parser, "queue", options.queue, 0, INT_MAX))
        return Trouble;
    for (std::size_t i = 0; i < parser.GetParamCount(); ++i)
        options.files.push_back(parser.GetParam(i).utf8_string());
    return std::nullopt;
}

bool Refuse(std::string const& file, std::string const& why) { return Fail(file + ": " + why); }

// What a file lacks to be a job, or nothing. The server looks for itself; but to ask here first spares it a
// ticket that is made in vain.
std::optional<std::string> WhyNoJob(std::string const& file, long long& size)
{
    struct stat status = {};
    if (stat(file.c_str(), &status) != 0 || access(file.c_str(), R_OK) != 0)
        return std::string("cannot be read: ") + std::strerror(errno);
    if (S_ISDIR(status.st_mode))
        return "is a folder, not a file";
    if (!S_ISREG(status.st_mode))
        return "is not a regular file";
    if (status.st_size == 0)
        return "is empty";
    size = status.st_size;
    return std::nullopt;
}

// The codes of ComGUI.Bundle, the plug-in of this package; another one has its own.
std::string ReasonOf(int code)
{
    switch (code)
    {
    case 113:
        return "the server cannot read it";
    case 114:
        return "the server takes regular files only";
    case 115:
        return "the server does not take its name";
    case 116:
        return "the server cannot write it; is its disk full?";
    case 117:
        return "the server takes no empty file";
    default:
        return "the server refuses it (the plug-in's code: " + std::to_string(code) + ")";
    }
}

// How far one job has come, as its events tell. They come on the receiver's thread.
class Progress
{
public:
    // From here on the events of that job count.
    void Begin(int job)
    {
        std::lock_guard const lock(m_lock);
        m_job = job;
        m_isIn = false;
        Draw(0);
    }

    // Ends the line that is drawn over and over. True if the server has said that the job is in.
    bool WaitForTheJob()
    {
        std::unique_lock lock(m_lock);
        m_came.wait_for(lock, EventsArriveWithin, [this] { return m_isIn; });
        Erase();
        m_job = NoJob;
        return m_isIn;
    }

    void GiveUp()
    {
        std::lock_guard const lock(m_lock);
        Erase();
        m_job = NoJob;
    }

    void Take(ServerNotificationEvent const& event)
    {
        NotifData const& data = event.GetNotifData();
        std::lock_guard const lock(m_lock);
        if (data.NotifKind != ParameterChange || data.NotifCode != JobType || data.NotifArgA != m_job)
            return;
        if (data.NotifKey == "Job/Progress")
            Draw(static_cast<int>(data.NotifNumber));
        if (data.NotifKey == "Job/State" && static_cast<int>(data.NotifNumber) == JobIsIn)
        {
            m_isIn = true;
            m_came.notify_all();
        }
    }

private:
    // The same line over and over.
    void Draw(int percent) const
    {
        if (!m_isTerminal)
            return;
        std::string bar(static_cast<std::size_t>(std::clamp(percent, 0, 100)) / 5, '#');
        bar.resize(20, ' ');
        std::printf("\r[%s] %3d %%", bar.c_str(), percent);
        std::fflush(stdout);
    }

    void Erase() const
    {
        if (m_isTerminal)
            std::printf("\r%28s\r", "");
    }

    static constexpr int NoJob = -1;

    bool const m_isTerminal = isatty(STDOUT_FILENO) == 1;
    std::mutex m_lock;
    std::condition_variable m_came;
    int m_job = NoJob;
    bool m_isIn = false;
};

// One value of a ticket. Folders come as paths of this machine, since the views resolve them.
bool PrintParameter(void* ticket, char const* key, PARAM_TYPE type, void const* value, int)
{
    std::string text = "(a value)";
    if (type == PARAM_INT)
        text = std::to_string(*static_cast<int const*>(value));
    else if (type == PARAM_INT64)
        text = std::to_string(*static_cast<long long const*>(value));
    else if (type == PARAM_DOUBLE)
        text = std::to_string(*static_cast<double const*>(value));
    else if (type == PARAM_STRING)
        text =
            static_cast<STICKET_READ const*>(ticket)->Decode(static_cast<char const*>(value)).utf8_string();
    std::printf("    %-36s %s\n", Shown(key).c_str(), Shown(text).c_str());
    return true;
}

void PrintTicket(MTICKET_ACCESS const* container, int job)
{
    STICKET_ACCESS const* const ticket = MTICKET_READ::Of(container)->OpenTicket(JobType, job);
    if (!ticket)
        return;
    constexpr int Everything = 8000;
    ticket->SWALKPARAMETERS(ticket->Instance, PrintParameter,
                            const_cast<STICKET_READ*>(STICKET_READ::Of(ticket)), "", Everything);
    MTICKET_ADMIN::Of(container)->CloseTicket(JobType, job, false);
}

// What ComGUIManager::UploadJob does, but with the code of a refusal, which that does not tell.
int Upload(ComGUIManager& manager, std::string path)
{
    char folder[] = "$(UPLOADJOB)";
    TJobIdentification job = {};
    job.nSize = sizeof job;
    job.pszUploadFolder = folder;
    return manager.SendJob(&job, path.data(), ComGUIManager::LeafName(path).data());
}

bool Submit(ComGUIManager& manager, OPTIONS const& options, std::string const& file, Progress& progress)
{
    long long size = 0;
    if (auto const why = WhyNoJob(file, size))
        return Refuse(file, *why);
    // What the numbers say is the server's matter: here the queue and the copies.
    int const job = manager.PrepareJob(file, options.queue, 0, -1, options.copies, 0);
    if (job < 0)
        return Refuse(file, manager.IsServerOnline() ? "the server does not take a job of this name"
                                                     : "the server does not answer any more");
    progress.Begin(job);
    if (int const code = Upload(manager, file); code != 0)
    {
        progress.GiveUp();
        return Refuse(file, ReasonOf(code));
    }
    bool const isIn = progress.WaitForTheJob();
    std::printf("%s: job %d, %lld bytes%s\n", Shown(file).c_str(), job, size,
                isIn ? "" : " (sent, but there is no word of it yet)");
    PrintTicket(manager.GetClientContainer(), job);
    FlushOutput();
    return true;
}

// Whether the jobs can be put where they shall; a server may drop the number of a queue that it does not
// have.
bool IsQueueThere(ComGUIManager& manager, int queue)
{
    std::vector<int> ids;
    MTICKET_READ::Of(manager.GetClientContainer())->GetTickets(QueueType, ids);
    if (queue == 0 || std::find(ids.begin(), ids.end(), queue) != ids.end())
        return true;
    std::string known;
    for (int const id : ids)
        known += (known.empty() ? "" : ", ") + std::to_string(id);
    return Fail("there is no queue " + std::to_string(queue) + "; there are " +
                (known.empty() ? "none" : known));
}

// All files are tried, whatever becomes of one, or of the output.
int SubmitAll(ComGUIManager& manager, TLogin* login, OPTIONS const& options)
{
    if (int const result = manager.SetCallback(login, nullptr); result != 0)
    {
        Fail("the plug-in takes no callback", result);
        return Trouble;
    }
    manager.EnableNotifications(login, JobType, EveryKey);
    Progress progress;
    std::size_t sent = 0;
    {
        EventReceiver const receiver([&](ServerNotificationEvent const& event) { progress.Take(event); });
        for (std::string const& file : options.files)
            sent += Submit(manager, options, file, progress) ? 1 : 0;
    }
    manager.DisableNotifications(login, JobType);
    if (!FlushOutput())
        return Trouble;
    return sent == options.files.size() ? Good : Refused;
}
}  // namespace

int main(int argc, char** argv)
{
    std::signal(SIGPIPE, SIG_IGN);
    wxInitializer const wx;  // without the arguments, of which it would warn where they are no UTF-8
    OPTIONS options;
    if (!wx.IsOk())
    {
        std::fputs("submit_job: wxWidgets cannot be started\n", stderr);
        return Trouble;
    }
    if (auto const status = Parse(argc, argv, options))
        return *status;

    ComGUIManager* const manager = ComGUIManager::GetInstance();
    if (!IsPlugInThere())
        return Trouble;
    SERVER const& server = options.server;
    TLogin* const login = NewRecord(server.user.utf8_str(), server.password.utf8_str(), server);
    if (!LogIn(*manager, login))
        return Trouble;
    int const status = IsQueueThere(*manager, options.queue) ? SubmitAll(*manager, login, options) : Refused;
    manager->Logout();  // and no Uninitialize, which waits: the process ends here anyway
    return status;
}
