// A process that is killed at any instant while files and jobs come in.
#include "standin/server/jobs/JobIntake.h"
#include "standin/server/transfer/TransferService.h"
#include "tests/server/MemoryFolder.h"
#include "tests/server/OpenedSite.h"
#include "tests/support/ChildProcess.h"
#include "tests/support/Files.h"
#include "tests/support/sanitizers.h"
#include <gtest/gtest.h>
#include <random>
#include <thread>

using namespace standin;
namespace fs = std::filesystem;

namespace
{
// The cheapest hash that yescrypt knows, of "secret".
constexpr char Seed[] = R"(<site version="1"><users><user name="operator" role="1" ticket="2"
    hash="$y$j75$k0xKNpTyyqUCI91fDe6.t/$AOpC.H0fgbhxHFr1JrsgxvC18fxDi2KoRtFQgKObcJ0"/></users>
    <ticket type="0" id="0">
        <parameter key="System/UseFolderVariables" type="int">3</parameter>
        <parameter key="System/InstallFolder" type="string">/</parameter>
        <parameter key="System/Folders/Temp" type="string">$(INSTALL)/temp</parameter>
        <parameter key="System/Folders/Job" type="string">$(INSTALL)/job</parameter>
    </ticket>
    <ticket type="17" id="2"/>
</site>)";

// Content that tells by itself whether it is whole: one of a few lengths, and one byte throughout.
std::string Whole(unsigned number)
{
    return std::string(20000 + 1000 * (number % 5), static_cast<char>('a' + number % 26));
}

bool IsWhole(std::string const& content)
{
    return content.size() >= 20000 && content.size() <= 24000 && content.size() % 1000 == 0 &&
           content.find_first_not_of(content[0]) == content.npos;
}

class KilledTransfers : public testing::Test
{
protected:
    KilledTransfers()
    {
        WriteFile(folder / "seed.xml", Seed);
        for (unsigned number = 0; number < 26; ++number)
            WriteFile(Source(number), Whole(number));
        OpenedSite(folder / "site", folder / "seed.xml");
    }

    fs::path Source(unsigned number) const { return folder / ("source" + std::to_string(number % 26)); }

    // Puts the same names over and over, fetches them and sends jobs, until it is killed.
    void Work(ChildProcess::Report const& report) const
    {
        OpenedSite site(folder / "site", folder / "seed.xml");
        Server& server = site.Server();
        auto const session = server.Login("operator", "secret");
        // Small pieces and a breath after each, so that most kills meet a file on its way.
        server.Transfers().Set({4000, [] { std::this_thread::sleep_for(std::chrono::microseconds(50)); }});
        using Request = TransferService::Request;
        for (unsigned number = 0;; ++number)
        {
            std::string const name = "file" + std::to_string(number % 3);
            int id = 0;
            bool const done =
                server.Transfers().Carry(*session, {Request::ToServer, Source(number), "$(TEMP)/" + name}) ==
                    Transferred &&
                server.Transfers().Carry(*session, {Request::ToClient, "$(TEMP)/" + name,
                                                    folder / ("back-" + name)}) == Transferred &&
                server.Jobs().Prepare(*session, {"job.pdf"}, id) == Transferred &&
                server.Jobs().Send(*session, Source(number), "job.pdf") == Transferred &&
                server.Jobs().Send(*session, Source(number + 1), "alone.pdf") == Transferred;
            if (!done || !server.Tickets().Delete(*session, {JobTicketType, id}))
                throw std::runtime_error("a transfer failed");
            report(number);
        }
    }

    MemoryFolder folder;
};

// The job's file as the ticket tells of it.
struct FoundJob
{
    long long state = -1;
    long long size = -1;
    std::string file;
    bool isPrepared = false;
};

FoundJob JobIn(Store& store, TicketAddress address)
{
    FoundJob job;
    store.Load(address,
               [&](std::string_view key, int, StoredValue const& value)
               {
                   if (key == "Job/State")
                       job.state = value.integer;
                   if (key == "Job/Size")
                       job.size = value.integer;
                   if (key == "Job/File")
                       job.file = value.bytes;
                   job.isPrepared = job.isPrepared || key == JobPreparedKey;
               });
    return job;
}
}  // namespace

TEST_F(KilledTransfers, LeaveNoHalfFileAndNoJobWithoutItsFile)
{
    std::mt19937_64 random(500);
    int workers = 0;
    int beginnings = 0;
    std::size_t jobs = 0;
    constexpr int Rounds = IsSanitized ? 40 : 500;
    auto const isEnough = [&]
    { return workers > 0 && beginnings > 0 && jobs > 0; };  // busy machines need more
    for (int round = 0; round < Rounds || (!isEnough() && round < 10 * Rounds); ++round)
    {
        ChildProcess child([this](ChildProcess::Report const& report) { Work(report); });
        if (round == 0)
            child.Next();  // one at least comes far enough, however busy the machine is
        std::this_thread::sleep_for(std::chrono::microseconds(random() % (IsSanitized ? 600000 : 25000)));
        child.Kill();
        workers += child.Last(-1) >= 0 ? 1 : 0;

        // As it was left, before anybody tidies up: files under real names are whole.
        for (auto const& entry : fs::recursive_directory_iterator(folder.Path()))
        {
            std::string const name = entry.path().filename().string();
            bool const isOurs =
                name.starts_with("file") || name.starts_with("back-") || name.ends_with(".pdf");
            beginnings += IsPartFileName(name) ? 1 : 0;
            ASSERT_TRUE(!isOurs || IsWhole(ContentOf(entry.path()))) << round << " " << entry.path();
        }

        OpenedSite site(folder / "site", folder / "seed.xml");
        std::size_t known = 0;
        for (TicketAddress const address : site.Tickets())
        {
            if (address.type != JobTicketType)
                continue;
            FoundJob const job = JobIn(site.Store(), address);
            ASSERT_EQ(job.state, 1) << round << " " << address.id;  // the others went with the opening
            ASSERT_FALSE(job.isPrepared) << round;
            ASSERT_TRUE(job.file.starts_with("$(JOB)/")) << round << " " << job.file;
            std::string const content = ContentOf(folder / ("site/job" + job.file.substr(6)));
            ASSERT_TRUE(IsWhole(content)) << round << " " << job.file;
            ASSERT_EQ(content.size(), static_cast<std::size_t>(job.size)) << round;
            ++known;
        }
        std::size_t folders = 0;
        for (auto const& entry : fs::recursive_directory_iterator(folder.Path()))
        {
            ASSERT_FALSE(IsPartFileName(entry.path().filename().string())) << round << " " << entry.path();
            folders += entry.path().parent_path().filename() == "job" ? 1 : 0;
        }
        ASSERT_EQ(folders, known) << round;
        jobs = std::max(jobs, known);

        if (round % 3 != 2)
            continue;
        auto const session = site.Server().Login("operator", "secret");  // lest the site grow
        for (TicketAddress const address : site.Tickets())
            ASSERT_TRUE(address.type != JobTicketType || site.Server().Tickets().Delete(*session, address));
    }
    EXPECT_GT(workers, 0) << "no child has lived long enough to carry a file";
    EXPECT_GT(beginnings, 0) << "no child was killed in the middle of a file";
    EXPECT_GT(jobs, 0u);
}
