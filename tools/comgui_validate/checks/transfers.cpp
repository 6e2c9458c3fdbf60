// Files there and back, and jobs.
#include "comgui/session/TJobIdentification.h"
#include "tools/comgui_validate/Session.h"

#include <chrono>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <thread>
#include <unistd.h>

namespace validate
{
namespace
{
namespace fs = std::filesystem;

class LocalFolder
{
public:
    LocalFolder()
    {
        std::string path = fs::temp_directory_path() / "comgui-validate-XXXXXX";
        if (!mkdtemp(path.data()))
            throw Skipped("no folder can be made in " + fs::temp_directory_path().string());
        m_path = path;
    }
    ~LocalFolder()
    {
        std::error_code ignored;
        fs::remove_all(m_path, ignored);
    }
    LocalFolder(LocalFolder const&) = delete;
    LocalFolder& operator=(LocalFolder const&) = delete;

    std::string Write(char const* name, std::string const& content) const
    {
        std::ofstream(m_path / name, std::ios::binary) << content;
        return m_path / name;
    }
    std::string PathOf(char const* name) const { return m_path / name; }

private:
    fs::path m_path;
};

std::string ContentOf(std::string const& path)
{
    std::ostringstream content;
    content << std::ifstream(path, std::ios::binary).rdbuf();
    return content.str();
}

using Entry = int (*)(void*, void*, char*, char*);

class Files
{
public:
    explicit Files(Session& session)
        : m_trial(session.GetTrial()), m_session(session),
          m_server(m_trial.Option("server-folder", "$(TEMP)") + "/ComGUIValidate-" + std::to_string(getpid()))
    {
        std::string const order = m_trial.Option("put", "local-first");
        if (order != "local-first" && order != "server-first")
            throw Skipped("--option put is local-first or server-first, not " + order);
        m_isLocalFirst = order == "local-first";
    }

    int Put(Entry entry, char const* name, std::string local)
    {
        return Call(entry, name, std::move(local), m_server, m_isLocalFirst);
    }
    int Get(Entry entry, char const* name, std::string local)
    {
        return Call(entry, name, std::move(local), m_server, !m_isLocalFirst);
    }
    std::string const& Server() const { return m_server; }

private:
    // The texts are overwritten at once, since they are the host's again.
    int Call(Entry entry, char const* name, std::string local, std::string server, bool isLocalFirst)
    {
        std::string& first = isLocalFirst ? local : server;
        std::string& second = isLocalFirst ? server : local;
        m_trial.Calling(std::string(name) + "(instance, session, " + Quoted(first) + ", " + Quoted(second) +
                        ")");
        int const code = entry(m_trial.GetModule().instance, m_session.Handle(), first.data(), second.data());
        std::fill(first.begin(), first.end(), '#');
        std::fill(second.begin(), second.end(), '#');
        return code;
    }

    Trial& m_trial;
    Session& m_session;
    std::string const m_server;
    bool m_isLocalFirst = true;
};

std::string AnyContent()
{
    std::string content;
    for (int i = 0; i < 100'000; ++i)
        content.push_back(static_cast<char>(i * 7 + i / 251));
    return content;
}

void MustPut(Session& session, Files& files, std::string const& local)
{
    auto const& table = session.GetTrial().GetModule().table;
    if (int const code = files.Put(table.PutFileSyncEntry, "PutFileSyncEntry", local); code != 0)
        throw Skipped("the server takes no file " + files.Server() + " (code " + std::to_string(code) +
                      "); name a folder with --option server-folder=PATH");
}

void ThereAndBack(Trial& trial)
{
    Session session(trial);
    LocalFolder const folder;
    Files files(session);
    std::string const content = AnyContent();
    MustPut(session, files, folder.Write("sent", content));
    auto const& table = trial.GetModule().table;
    trial.ExpectZero("X1", files.Get(table.GetFileSyncEntry, "GetFileSyncEntry", folder.PathOf("fetched")));
    trial.Expect("X1", ContentOf(folder.PathOf("fetched")) == content, "another content", "what was sent");
}

void MissingFile(Trial& trial)
{
    Session session(trial);
    LocalFolder const folder;
    Files files(session);
    auto const& table = trial.GetModule().table;
    trial.ExpectFailure("X2",
                        files.Put(table.PutFileSyncEntry, "PutFileSyncEntry", folder.PathOf("missing")));
}

// Within a third of the check's time.
bool Becomes(Trial const& trial, std::string const& content, std::function<std::string()> const& look)
{
    auto const end = std::chrono::steady_clock::now() + trial.GetOptions().limit / 3;
    while (look() != content)
    {
        if (std::chrono::steady_clock::now() > end)
            return false;
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
    }
    return true;
}

void Async(Trial& trial)
{
    Session session(trial);
    LocalFolder const folder;
    Files files(session);
    MustPut(session, files, folder.Write("sent", "another content"));
    auto const& table = trial.GetModule().table;
    std::string const content = AnyContent();
    if (files.Put(table.PutFileEntry, "PutFileEntry", folder.Write("sent", content)) != 0)
        throw Skipped("the plug-in does not send files on its own");
    trial.Expect("X3",
                 Becomes(trial, content,
                         [&]
                         {
                             files.Get(table.GetFileSyncEntry, "GetFileSyncEntry", folder.PathOf("fetched"));
                             return ContentOf(folder.PathOf("fetched"));
                         }),
                 "another content", "what PutFileEntry has sent");
    if (files.Get(table.GetFileEntry, "GetFileEntry", folder.PathOf("later")) != 0)
        throw Skipped("the plug-in does not fetch files on its own");
    trial.Expect("X3", Becomes(trial, content, [&] { return ContentOf(folder.PathOf("later")); }),
                 "another content", "what GetFileEntry was to fetch");
}

// Record and folder text are overwritten and freed as soon as the entry returns.
int SendJob(Trial& trial, Session& session, std::string path, std::string name)
{
    auto const record = std::make_unique<TJobIdentification>();
    auto const folder = std::make_unique<std::string>("$(UPLOADJOB)");
    record->nSize = sizeof *record;
    record->iJobArg1 = -1;
    record->pszUploadFolder = folder->data();
    Module& module = trial.GetModule();
    trial.Calling("SendJobEntry(instance, session, job, " + Quoted(path) + ", " + Quoted(name) + ")");
    int const code =
        module.table.SendJobEntry(module.instance, session.Handle(), record.get(), path.data(), name.data());
    std::fill(folder->begin(), folder->end(), '#');
    std::memset(static_cast<void*>(record.get()), 0x5A, sizeof *record);
    std::fill(path.begin(), path.end(), '#');
    std::fill(name.begin(), name.end(), '#');
    return code;
}

void Job(Trial& trial)
{
    if (trial.Option("jobs", "no") != "yes")
        throw Skipped("a server may print the job; allow it with --option jobs=yes");
    Session session(trial);
    LocalFolder const folder;
    trial.ExpectFailure("X2", SendJob(trial, session, folder.PathOf("missing"), "missing"));
    trial.ExpectZero("X4", SendJob(trial, session, folder.Write("job.pdf", "%PDF-1.4\n"), "job.pdf"));
}

void KeepsNothing(Trial& trial)
{
    Session session(trial);
    LocalFolder const folder;
    Files files(session);
    std::string const content = AnyContent();
    MustPut(session, files, folder.Write("sent", content));
    auto const& table = trial.GetModule().table;
    for (int i = 0; i < 5; ++i)
        files.Get(table.GetFileEntry, "GetFileEntry", folder.PathOf(("fetched" + std::to_string(i)).c_str()));
    trial.Expect("G2", Becomes(trial, content, [&] { return ContentOf(folder.PathOf("fetched4")); }),
                 "no file where it was to be fetched to", "the file, though the texts have gone");
}
}  // namespace

std::vector<Check> TransferChecks()
{
    return {{"transfers.there-and-back", ThereAndBack},
            {"transfers.missing-file", MissingFile},
            {"transfers.async", Async},
            {"transfers.job", Job},
            {"transfers.keeps-nothing", KeepsNothing}};
}
}  // namespace validate
