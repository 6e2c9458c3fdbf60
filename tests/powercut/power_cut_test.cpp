// What a site and ticket files keep after a power cut. A client works under the recorder, which writes down
// all that reaches its files; then the model of a forgetful disk makes of that log what a power cut at some
// moment may leave, and a fresh client opens it.
//
// COMGUI_POWER_CUTS is how many cuts a test makes at random moments, and as many at acknowledgements;
// COMGUI_POWER_CUT_SEED draws others.
#include "standin/server/store/sqlite/SqliteStore.h"
#include "tests/powercut/ForgetfulDisk.h"
#include "tests/powercut/History.h"
#include "tests/server/MemoryFolder.h"
#include "tests/support/Files.h"
#include "tests/support/Program.h"
#include "tests/support/SiteClient.h"
#include <algorithm>
#include <gtest/gtest.h>
#include <sstream>
#include <sys/wait.h>
#include <unistd.h>

namespace fs = std::filesystem;
using namespace std::chrono_literals;

namespace
{
constexpr auto Patience = 120s;

std::size_t NumberFrom(char const* variable, std::size_t otherwise)
{
    char const* const text = std::getenv(variable);
    return text ? std::stoul(text) : otherwise;
}

// The environment of the programs that are started while it lives.
class Variable
{
public:
    Variable(char const* name, std::string const& value) : m_name(name) { setenv(name, value.c_str(), 1); }
    ~Variable() { unsetenv(m_name); }
    Variable(Variable const&) = delete;
    Variable& operator=(Variable const&) = delete;

private:
    char const* m_name;
};

// What a fresh client finds.
struct Found
{
    struct Job
    {
        int state = -1;
        std::string name;
        std::string file;
    };

    bool isWhole = false;  // the client has come to its end
    std::vector<Job> jobs;
    std::set<std::string> tickets;
};

// A moment in the log, and what survives then.
struct Cut
{
    std::size_t records;
    Survivors survivors;
    std::size_t number;

    std::string Name() const
    {
        return "cut " + std::to_string(number) + ", behind record " + std::to_string(records) +
               ", survivors " + NameOf(survivors);
    }
};

class PowerCut : public testing::Test
{
protected:
    PowerCut() { fs::create_directory(disk); }

    using Command = std::vector<std::string>;

    // Takes what is on the disk as being there for good, and records what the clients do: those of a stage
    // all at once, one stage after the other.
    void Record(std::vector<std::vector<Command>> stages)
    {
        for (auto& clients : stages)
            for (Command& command : clients)
                command.insert(command.begin(), COMGUI_POWER_CUT_CLIENT);
        RecordPrograms(stages);
    }

    void RecordPrograms(std::vector<std::vector<Command>> const& stages)
    {
        before.emplace(disk);
        {
            Variable const preload("LD_PRELOAD", COMGUI_DISK_RECORDER);
            Variable const root("COMGUI_DISK_ROOT", disk.string());
            Variable const file("COMGUI_DISK_LOG", (folder / "log").string());
            Variable const place("COMGUI_SITE", site.string());
            for (auto const& clients : stages)
            {
                std::vector<std::unique_ptr<Program>> programs;
                for (Command const& command : clients)
                    programs.push_back(std::make_unique<Program>(command));
                for (auto const& program : programs)
                    ASSERT_EQ(program->Wait(), 0);
            }
        }
        log = ReadDiskLog(folder / "log");
        ExpectLogToBeComplete();
    }

    // With nothing forgotten, the disk of the log is the one that the clients have left.
    void ExpectLogToBeComplete()
    {
        ForgetfulDisk model = *before;
        for (DiskRecord const& record : log)
            model.Replay(record);
        ForgetfulDisk::Random anyChance;
        model.Restore(folder / "whole", Survivors::Everything, anyChance);
        auto const left = FilesIn(disk);
        ASSERT_FALSE(left.empty());
        EXPECT_EQ(FilesIn(folder / "whole"), left) << "the recorder has missed something";
    }

    // Without the content of those that are mapped.
    static std::map<std::string, std::string> FilesIn(fs::path const& place)
    {
        std::map<std::string, std::string> files;
        for (auto const& entry : fs::recursive_directory_iterator(place))
        {
            std::string const name = fs::relative(entry.path(), place).string();
            bool const isMapped = name.ends_with("-shm") || name.ends_with("site.lock");
            files[name] = entry.is_directory() || isMapped ? "" : ContentOf(entry.path());
        }
        return files;
    }

    // At every moment. With everything surviving, a cut is the end of the process alone.
    std::vector<Cut> CutsBehindEachRecord(Survivors survivors) const
    {
        std::vector<Cut> cuts;
        for (std::size_t record = 0; record <= log.size(); ++record)
            cuts.push_back({record, survivors, record});
        return cuts;
    }

    // Behind acknowledgements, where the strictest disk loses most.
    std::vector<Cut> CutsAtAcknowledgements(std::size_t count)
    {
        std::vector<std::size_t> acknowledged;
        for (std::size_t i = 0; i < log.size(); ++i)
            if (log[i].head.call == DiskCall::Mark && log[i].path.starts_with("done "))
                acknowledged.push_back(i + 1);
        std::shuffle(acknowledged.begin(), acknowledged.end(), random);
        acknowledged.resize(std::min(acknowledged.size(), count));
        std::vector<Cut> cuts;
        for (std::size_t const record : acknowledged)
            cuts.push_back({record, Survivors::Nothing, 0});
        return Numbered(cuts);
    }

    // So many of those, and as many at random: half of them anywhere, half where the work passes from one
    // file to another, since it is the order among files that promises hang on.
    std::vector<Cut> Cuts(std::size_t count)
    {
        std::vector<Cut> cuts = CutsAtAcknowledgements(count);
        std::vector<std::size_t> steps;
        for (std::size_t i = 1; i < log.size(); ++i)
            if (log[i].head.file != log[i - 1].head.file || log[i].path != log[i - 1].path)
                steps.push_back(i);
        for (std::size_t i = 0; i < count; ++i)
        {
            std::size_t const record =
                random() % 2 == 0 ? steps[random() % steps.size()] : random() % (log.size() + 1);
            cuts.push_back({record, AllSurvivors[i % AllSurvivors.size()], 0});
        }
        return Numbered(cuts);
    }

    static std::vector<Cut> Numbered(std::vector<Cut> cuts)
    {
        std::sort(cuts.begin(), cuts.end(),
                  [](Cut const& one, Cut const& other) { return one.records < other.records; });
        for (std::size_t i = 0; i < cuts.size(); ++i)
            cuts[i].number = i;
        return cuts;
    }

    // Restores each of them in turn and has it looked at; ends with the first that fails.
    void ForEach(std::vector<Cut> const& cuts, std::function<void()> const& look)
    {
        ASSERT_FALSE(cuts.empty());
        now.emplace(*before);
        std::size_t replayed = 0;
        marks.clear();
        for (Cut const& cut : cuts)
        {
            for (; replayed < cut.records; ++replayed)
            {
                now->Replay(log[replayed]);
                if (log[replayed].head.call == DiskCall::Mark)
                    marks.push_back(log[replayed].path);
            }
            SCOPED_TRACE(cut.Name() + " of " + std::to_string(log.size()));
            ForgetfulDisk::Random chance(seed * 1000003 + cut.number);
            now->Restore(after, cut.survivors, chance);
            look();
            if (HasFailure())
                return;
        }
    }

    // What the whole log acknowledges.
    int AllAcknowledged() const
    {
        return static_cast<int>(std::count_if(log.begin(), log.end(),
                                              [](DiskRecord const& record)
                                              { return record.path.starts_with("done "); }));
    }

    // The highest number of a deed that was acknowledged before the cut, plus one.
    int Acknowledged() const { return Count("done "); }
    int Begun() const { return Count("begun "); }
    int Count(std::string_view beginning) const
    {
        return static_cast<int>(std::count_if(marks.begin(), marks.end(),
                                              [beginning](std::string const& mark)
                                              { return mark.starts_with(beginning); }));
    }

    // Opens the site that the cut has left, which must be sound, and stay so.
    Found Inspect() const
    {
        fs::path const place = after / fs::relative(site, disk);
        Found found;
        {
            Variable const variable("COMGUI_SITE", place.string());
            Program program({COMGUI_POWER_CUT_CLIENT, "inspect"});
            while (auto const line = program.Line(Program::Clock::now() + Patience))
                Take(*line, found);
            EXPECT_EQ(program.Wait(), 0);
        }
        EXPECT_TRUE(found.isWhole);
        // The folder of a job that nobody was promised may be set aside, when the cut took the site's
        // beginning back.
        for (std::string const& name : NamesIn(place))
            EXPECT_EQ(name.find(".damaged-"), name.npos) << name;
        standin::SqliteStore store(place, [] { return standin::StoreContent(); });
        EXPECT_EQ(store.Check({}), std::vector<std::string>{});
        return found;
    }

    static void Take(std::string const& line, Found& found)
    {
        std::istringstream words(line);
        std::string kind;
        words >> kind;
        if (kind == "job")
        {
            Found::Job& job = found.jobs.emplace_back();
            words >> job.state >> job.name >> job.file;
        }
        else if (kind == "ticket")
            found.tickets.insert(line);
        else
            found.isWhole = line == "end";
    }

    // --- jobs

    // Files of which each tells by itself whether it is whole.
    void MakeSources(int count) const
    {
        fs::create_directory(folder / "sources");
        for (int i = 0; i < count; ++i)
            WriteFile(folder / "sources" / ("job-" + std::to_string(i)), Source(i));
    }

    static std::string Source(int i)
    {
        std::string text;
        for (int line = 0; line < 200 + 900 * (i % 3); ++line)
            text += "job " + std::to_string(i) + " line " + std::to_string(line) + "\n";
        return text;
    }

    void ExpectJobs() const
    {
        auto const whole = WholeJobs();
        for (int i = 0; i < Acknowledged(); ++i)
            EXPECT_TRUE(whole.contains("job-" + std::to_string(i))) << "job " << i << " is lost";
    }

    // The jobs that there are; each of them must have its file.
    std::set<std::string> WholeJobs() const
    {
        Found const found = Inspect();
        std::set<std::string> whole;
        for (Found::Job const& job : found.jobs)
        {
            if (!job.name.starts_with("job-"))
                continue;  // the seed has some, without files
            EXPECT_EQ(job.state, 1) << job.name;
            EXPECT_TRUE(job.file.starts_with("$(JOB)/")) << job.name << " " << job.file;
            fs::path const file = after / fs::relative(site, disk) / "job" / job.file.substr(7);
            EXPECT_TRUE(fs::exists(file)) << job.name << " has lost its file";
            EXPECT_TRUE(fs::exists(file) && ContentOf(file) == Source(std::stoi(job.name.substr(4))))
                << file << " is not whole";
            whole.insert(job.name);
        }
        return whole;
    }

    // --- the history

    // Which of the contents from that step to the last one begun is there; none otherwise.
    std::optional<int> StepFound(std::set<std::string> const& tickets, int first)
    {
        while (static_cast<int>(contents.size()) <= Begun())
            contents.push_back(ContentAfter(static_cast<int>(contents.size())));
        for (int step = Begun(); step >= first; --step)
            if (contents[static_cast<std::size_t>(step)] == tickets)
                return step;
        return std::nullopt;
    }

    // --- the exchange of a database

    static void Commit(standin::SqliteStore& store, standin::TicketAddress address, std::string const& file)
    {
        standin::TicketChange change;
        change.kind = standin::TicketChange::Create;
        change.address = address;
        change.parameters.push_back({"Job/File", -1, standin::TicketValue::String(file), false});
        ASSERT_EQ(store.Commit(change, ++commits).kind, standin::CommitOutcome::Committed);
    }

    // A site whose newest changes are in its journal, as a program leaves it that is killed; with a job that
    // the backup has and one that it does not know.
    void MakeKilledSiteWithBackup(fs::path const& backup) const
    {
        for (char const* const job : {"1", "2"})
        {
            fs::create_directories(site / "job" / job);
            WriteFile(site / "job" / job / "a", "content");
        }
        pid_t const child = fork();
        if (child == 0)
        {
            auto const content = []
            {
                standin::StoreContent first;
                first.tickets.emplace_back().kind = standin::TicketChange::Create;
                return first;
            };
            standin::SqliteStore store(site, content);
            Commit(store, {3, 1}, "$(JOB)/1/a");
            store.BackupTo(backup, {});
            Commit(store, {3, 2}, "$(JOB)/2/a");
            _exit(HasFailure() ? 1 : 0);
        }
        int status = -1;
        ASSERT_EQ(waitpid(child, &status, 0), child);
        ASSERT_EQ(status, 0);
    }

    static std::vector<standin::TicketAddress> TicketsOf(fs::path const& place)
    {
        standin::SqliteStore store(
            place, []() -> standin::StoreContent { throw std::runtime_error("there is no database"); });
        std::vector<standin::TicketAddress> tickets;
        store.Tickets([&](standin::TicketAddress address, auto const&) { tickets.push_back(address); });
        return tickets;
    }

    // The old site as it was, or the new one and the old one's database beside it. Nobody's files are gone.
    void ExpectOldOrNew(int& seen)
    {
        fs::path const place = after / fs::relative(site, disk);
        std::map<std::string, fs::path> jobs;  // where the folders are
        std::optional<fs::path> aside;
        for (auto const& entry : fs::recursive_directory_iterator(place))
        {
            if (entry.is_regular_file() && entry.path().filename() == "a")
                jobs[entry.path().parent_path().filename()] = entry.path().parent_path().parent_path();
            if (entry.path().filename().string().starts_with("site.db.replaced-"))
                aside = entry.path();
        }
        ASSERT_EQ(jobs.size(), 2u);
        EXPECT_EQ(jobs["1"], place / "job");
        std::vector<standin::TicketAddress> const oldOnes{{0, 0}, {3, 1}, {3, 2}};
        auto const tickets = TicketsOf(place);
        if (tickets == oldOnes)
            return;
        ++seen;
        EXPECT_EQ(tickets, (std::vector<standin::TicketAddress>{{0, 0}, {3, 1}}));
        EXPECT_NE(jobs["2"], place / "job") << "the server would sweep it";
        ASSERT_TRUE(aside);
        fs::path const other = folder / "other";
        fs::remove_all(other);
        fs::create_directory(other);
        fs::copy_file(*aside, other / "site.db");
        EXPECT_EQ(TicketsOf(other), oldOnes);
    }

    // --- files

    // The file is there as one of those that it has been, as a whole.
    std::string ExpectWholeFile(std::string const& name) const
    {
        fs::path const file = after / name;
        bool const isThere = fs::exists(file);
        EXPECT_TRUE(isThere) << name << " is gone";
        std::string const content = isThere ? ContentOf(file) : "";
        EXPECT_TRUE(now->ContentsOf(name).contains(content))
            << name << " is neither the old one nor the new one, but these " << content.size() << " bytes:\n"
            << content;
        return content;
    }

    // Of the table that the client has written last; 0 if there is none.
    static int TableIn(std::string const& xml)
    {
        std::size_t const key = xml.find("key=\"Table/0\"");
        return key == xml.npos ? 0 : std::stoi(xml.substr(xml.find('>', key) + 1));
    }

    static inline std::uint64_t commits = 0;
    std::size_t const seed = NumberFrom("COMGUI_POWER_CUT_SEED", 1);
    std::size_t const cutsAtEach = NumberFrom("COMGUI_POWER_CUTS", 30);
    ForgetfulDisk::Random random{seed};
    MemoryFolder folder;
    fs::path const disk = folder / "disk";
    fs::path site = disk / "site";
    fs::path const after = folder / "after";  // what the cut has left of the disk
    std::optional<ForgetfulDisk> before;
    std::vector<DiskRecord> log;
    std::vector<std::set<std::string>> contents;  // of the history, by the number of steps
    std::vector<std::string> marks;               // before the cut
    std::optional<ForgetfulDisk> now;             // at the cut
};
}  // namespace

// --- jobs

TEST_F(PowerCut, JobThatWasAcknowledged_IsThereWithItsWholeFile)
{
    constexpr int Jobs = 12;
    SiteClient::MakeSite(site);
    MakeSources(Jobs);
    Record({{{"jobs", std::to_string(Jobs), folder / "sources"}}});
    ForEach(Cuts(3 * cutsAtEach), [this] { ExpectJobs(); });
    EXPECT_EQ(AllAcknowledged(), Jobs);
}

TEST_F(PowerCut, JobThatWasDeleted_ComesBackWithItsFileOrNotAtAll)
{
    constexpr int Jobs = 8;
    SiteClient::MakeSite(site);
    MakeSources(Jobs);
    Record({{{"deletions", std::to_string(Jobs), folder / "sources"}}});
    std::size_t back = 0;
    ForEach(Cuts(3 * cutsAtEach), [&] { back += WholeJobs().size(); });
    EXPECT_GT(back, 0u) << "no cut has found a job";
    EXPECT_EQ(AllAcknowledged(), Jobs);
}

// Nothing of the site was there before, not even the folder that it is in.
TEST_F(PowerCut, JobOfANewSite_IsThereWithItsWholeFile)
{
    site = disk / "made" / "for" / "the site";
    MakeSources(2);
    Record({{{"jobs", "2", folder / "sources"}}});
    ForEach(CutsAtAcknowledgements(2), [this] { ExpectJobs(); });
    EXPECT_EQ(AllAcknowledged(), 2);
}

// Another program has made the folder, and has not come as far as to flush its name.
TEST_F(PowerCut, JobOfANewSiteInAFolderThatWasThere_IsThereWithItsWholeFile)
{
    site = disk / "made" / "for" / "the site";
    MakeSources(2);
    RecordPrograms(
        {{{"/bin/mkdir", "-p", site}}, {{COMGUI_POWER_CUT_CLIENT, "jobs", "2", folder / "sources"}}});
    ForEach(CutsAtAcknowledgements(2), [this] { ExpectJobs(); });
    EXPECT_EQ(AllAcknowledged(), 2);
}

// --- tickets

TEST_F(PowerCut, FullDurability_KeepsEveryAcknowledgedChange)
{
    constexpr int Steps = 48;
    SiteClient::MakeSite(site);
    {
        Variable const full("COMGUI_DURABILITY", "full");
        Record({{{"history", "0", std::to_string(Steps)}}});
    }
    ForEach(Cuts(cutsAtEach),
            [this]
            {
                Found const found = Inspect();
                EXPECT_TRUE(StepFound(found.tickets, Acknowledged()))
                    << "after " << Acknowledged() << " steps: " << testing::PrintToString(found.tickets);
            });
    EXPECT_EQ(AllAcknowledged(), Steps);
}

TEST_F(PowerCut, FullDurability_HoldsForThreadsAndProgramsThatFlushForEachOther)
{
    SiteClient::MakeSite(site);
    {
        Variable const full("COMGUI_DURABILITY", "full");
        Variable const slow("COMGUI_DISK_FLUSH_US", "1000");  // time for others to come in between
        Record({{{"crowd", "A", "20"}, {"crowd", "B", "20"}}});
    }
    ForEach(Cuts(cutsAtEach),
            [this]
            {
                std::map<std::string, std::int64_t> acknowledged;
                for (std::string const& mark : marks)
                    if (mark.starts_with("done "))
                        acknowledged[mark.substr(5, 2)] = std::stoll(mark.substr(8));
                Found const found = Inspect();
                std::string const ticket = found.tickets.empty() ? "" : *found.tickets.begin();
                for (auto const& [key, value] : acknowledged)
                {
                    std::size_t const at = ticket.find(" " + key + "=");
                    ASSERT_NE(at, ticket.npos) << key << " is lost: " << ticket;
                    EXPECT_GE(std::stoll(ticket.substr(at + 4)), value) << key;
                }
            });
    EXPECT_EQ(AllAcknowledged(), 80);
}

TEST_F(PowerCut, PlainDurability_KeepsAPrefixOfTheHistory)
{
    SiteClient::MakeSite(site);
    // Enough for the first client to work the journal in while it is at it; the second one begins a new one.
    Record({{{"history", "0", "400"}}, {{"history", "400", "40"}}});
    int longest = 0;
    int lost = 0;
    ForEach(Cuts(2 * cutsAtEach),
            [&]
            {
                Found const found = Inspect();
                auto const step = StepFound(found.tickets, 0);
                ASSERT_TRUE(step) << "after " << Begun()
                                  << " steps: " << testing::PrintToString(found.tickets);
                longest = std::max(longest, *step);
                lost += *step < Acknowledged() ? 1 : 0;
            });
    EXPECT_GT(longest, 0) << "nothing has ever lasted";
    EXPECT_GT(lost, 0) << "no cut has taken anything back";
}

// --- a database that is exchanged

TEST_F(PowerCut, Restore_LeavesTheOldSiteOrTheNewOneAtEveryInstant)
{
    fs::create_directory(site);
    fs::path const backup = folder / "backup.db";
    MakeKilledSiteWithBackup(backup);
    RecordPrograms({{{COMGUI_SITE_PROGRAM, site, "restore", backup}}});
    int seen = 0;
    ForEach(CutsBehindEachRecord(Survivors::Everything), [&] { ExpectOldOrNew(seen); });
    for (Survivors const survivors : {Survivors::Nothing, Survivors::AnySubset, Survivors::NamesAlone})
        ForEach(CutsBehindEachRecord(survivors), [&] { ExpectOldOrNew(seen); });
    EXPECT_GT(seen, 0);
}

// --- files that are replaced as a whole

TEST_F(PowerCut, TicketFile_IsTheOldOneOrTheNewOneAndLastsOnceItIsSaved)
{
    constexpr int Saved = 25;
    WriteFile(disk / "local.xml", "<ticket version=\"1\"/>");
    Record({{{"file", disk / "local.xml", std::to_string(Saved)}}});
    ForEach(Cuts(10 * cutsAtEach),
            [this]
            {
                int const table = TableIn(ExpectWholeFile("local.xml"));
                EXPECT_TRUE(Acknowledged() <= table && table <= Begun())
                    << table << " after " << Acknowledged() << " that were saved";
            });
    EXPECT_EQ(AllAcknowledged(), Saved);
    EXPECT_EQ(now->ContentsOf("local.xml").size(), Saved + 1u);
}

TEST_F(PowerCut, CopyOfTheSystemTicket_IsTheOldOneOrTheNewOne)
{
    SiteClient::MakeSite(site);
    Record({{{"system", "25"}}});
    std::vector<Cut> cuts = Cuts(10 * cutsAtEach);
    auto const ready =
        std::find_if(log.begin(), log.end(), [](DiskRecord const& record) { return record.path == "ready"; });
    std::erase_if(cuts, [&](Cut const& cut)  // the first one is only just being made
                  { return cut.records <= static_cast<std::size_t>(ready - log.begin()); });
    ForEach(cuts, [this] { ExpectWholeFile("site/tickets/SYS_0000.xml"); });
    EXPECT_GT(now->ContentsOf("site/tickets/SYS_0000.xml").size(), 1u);
}

TEST_F(PowerCut, FullDurability_KeepsCarriedFiles)
{
    constexpr int Carried = 6;
    SiteClient::MakeSite(site);
    fs::create_directory(site / "temp");
    MakeSources(Carried);
    {
        Variable const full("COMGUI_DURABILITY", "full");
        Record({{{"carry", std::to_string(Carried), folder / "sources", disk / "fetched"}}});
    }
    ForEach(CutsAtAcknowledgements(Carried),
            [this]
            {
                for (char const* const name : {"site/temp/file", "fetched"})
                    EXPECT_EQ(ExpectWholeFile(name), Source(Acknowledged() - 1)) << name;
            });
    EXPECT_EQ(AllAcknowledged(), Carried);
}

// Without that they are not acknowledged for good; but what has their name is one of them, and not a half.
TEST_F(PowerCut, CarriedFile_IsTheOldOneOrTheNewOne)
{
    constexpr int Carried = 6;
    SiteClient::MakeSite(site);
    fs::create_directory(site / "temp");
    for (fs::path const& file : {site / "temp" / "file", disk / "fetched"})
        WriteFile(file, "old");
    MakeSources(Carried);
    Record({{{"carry", std::to_string(Carried), folder / "sources", disk / "fetched"}}});
    ForEach(Cuts(10 * cutsAtEach),
            [this]
            {
                ExpectWholeFile("site/temp/file");
                ExpectWholeFile("fetched");
            });
    EXPECT_EQ(now->ContentsOf("site/temp/file").size(), Carried + 1u);
    EXPECT_EQ(now->ContentsOf("fetched").size(), Carried + 1u);
}
