#include "tests/module/HistoryRun.h"

#include "tests/module/ModelFiles.h"
#include "tests/module/ModuleModel.h"
#include "tests/module/ModuleProgram.h"
#include "tests/module/OtherProgram.h"
#include "tests/server/MemoryFolder.h"
#include "tests/support/Files.h"
#include "tests/support/SiteClient.h"
#include <algorithm>
#include <unistd.h>

namespace fs = std::filesystem;

namespace
{
constexpr std::size_t NewsEvery = 16;  // steps

// What every history ends with, so that all that was handed out is read once more.
std::vector<STEP> WithItsEnd(std::vector<STEP> history)
{
    STEP step;
    step.action = ACTION::Release;
    history.push_back(step);
    step.action = ACTION::LogOut;
    for (step.session = 0; step.session < STEP::Sessions; ++step.session)
        history.push_back(step);
    step.action = ACTION::CloseFile;
    step.session = STEP::Files;
    for (step.table = 0; step.table < STEP::OpenFiles; ++step.table)
        history.push_back(step);
    return history;
}

struct DIFFERENCE
{
    std::string text;
};

// Where it differs from another text, with what stands around there.
std::string Shown(std::string const& text, std::size_t difference)
{
    constexpr std::size_t Before = 500;
    constexpr std::size_t Length = 1500;
    std::size_t const begin = difference - std::min(difference, Before);
    std::string const end = text.size() > begin + Length ? " ..." : "";
    return (begin ? "... " : "") + text.substr(begin, Length) + end;
}

void ThrowIfDifferent(std::string const& what, std::string const& expected, std::string const& found)
{
    if (found == expected)
        return;
    auto const ends = std::mismatch(expected.begin(), expected.end(), found.begin(), found.end());
    auto const difference = static_cast<std::size_t>(ends.first - expected.begin());
    throw DIFFERENCE{what + "\n--- expected:\n" + Shown(expected, difference) + "\n--- found:\n" +
                     Shown(found, difference) + "\n"};
}

class HISTORY_RUN
{
public:
    HISTORY_RUN(fs::path const& folder, std::vector<STEP> const& history)
        : m_history(history), m_other(folder, history), m_here(folder, 0)
    {
    }

    // Throws DIFFERENCE. Gives what a program that comes later must find.
    std::string Run()
    {
        while (m_next < m_history.size())
            RunNext();
        CompareNews();
        Compare("the folders", m_model.Folders(), m_here.Folders());
        Compare("all tickets, in the first program", m_model.Everything(0), m_here.Everything());
        Compare("all tickets, in the second program", m_model.Everything(1), m_other.Everything());
        m_other.End();
        return m_model.Everything(2);
    }

private:
    void RunNext()
    {
        std::size_t const number = m_next++;
        STEP const& step = m_history[number];
        bool const isAtWork = step.session < STEP::Sessions && m_walks[step.session] > 0;
        if (isAtWork && step.action == ACTION::LogIn)
            return;  // a walk ends with its session
        if (MODULE_MODEL::EndsNotifications(step.action))
            CompareNews();
        if (step.action == ACTION::WalkTickets)
            WalkTickets(number);
        else if (step.action == ACTION::WalkValues)
            WalkValues(number);
        else if (auto const expected = m_model.Run(step))
            Compare(number, *expected, Found(number));
        // Who subscribes while its program is behind may be told of what was before; so it catches up first.
        if (number % NewsEvery == 0 || step.action == ACTION::Release)
            CompareNews();
    }

    std::string Found(std::size_t number)
    {
        STEP const& step = m_history[number];
        return step.IsElsewhere() ? m_other.Run(number) : m_here.Run(step);
    }

    void CompareNews()
    {
        if (!m_model.IsHeld())
            Compare("notifications of the first program", m_model.News(0), m_here.News());
        Compare("notifications of the second program", m_model.News(1), m_other.News());
    }

    // Carries out the steps that belong into a walk.
    void RunInside(STEP const& step)
    {
        ++m_walks[step.session];
        for (int i = 0; i < step.during && m_next < m_history.size(); ++i)
            RunNext();
        --m_walks[step.session];
    }

    void WalkTickets(std::size_t number)
    {
        STEP const& step = m_history[number];
        if (!m_model.HasBegun(step))
            return;
        auto const ids = m_model.BeginTickets(step);
        std::size_t next = 0;
        auto const nextVisit = [&]
        {
            std::optional<MODULE_MODEL::VISIT> visit;
            while (ids && !visit && next < ids->size())
                visit = m_model.Visited(step, (*ids)[next++]);
            return visit;
        };
        std::optional<MODULE_MODEL::VISIT> visit;
        Walk(
            number, ids.has_value(),
            [&]
            {
                visit = nextVisit();
                return visit.has_value();
            },
            [&] { return m_model.TextOf(step, *visit); });
    }

    void WalkValues(std::size_t number)
    {
        STEP const& step = m_history[number];
        if (!m_model.HasValues(step))
            return;
        auto walk = m_model.BeginValues(step);
        std::optional<std::string> line;
        Walk(
            number, walk.has_value(),
            [&]
            {
                line = walk ? m_model.NextValue(*walk) : std::nullopt;
                return line.has_value();
            },
            [&] { return *line; });
        if (walk)
            m_model.End(*walk);
    }

    // next: goes on to the next place of the model's walk; false at its end. text: what is there now.
    void Walk(std::size_t number, bool isTaken, std::function<bool()> const& next,
              std::function<std::string()> const& text)
    {
        STEP const& step = m_history[number];
        std::string const result = isTaken ? "1" : "0";
        int places = 0;
        if (step.IsElsewhere())
        {
            std::string expected = result + "\n";
            while (places != std::max(step.stop, 0) || places == 0)
            {
                if (!next())
                    break;
                expected += text() + "\n";
                ++places;
            }
            return Compare(number, expected, m_other.Run(number));
        }
        std::exception_ptr difference;  // no exception may pass through the module
        bool isGivenUp = false;
        auto const place = [&](std::function<std::string()> const& found)
        {
            try
            {
                Compare(number, next() ? text() : "the end of the walk", found());
                if (places == step.number)
                {
                    RunInside(step);
                    Compare(number, text(), found());
                }
            }
            catch (...)
            {
                difference = std::current_exception();
                return false;
            }
            isGivenUp = ++places == step.stop;
            return !isGivenUp;
        };
        int const found = step.action == ACTION::WalkTickets ? m_here.WalkTickets(step, place)
                                                             : m_here.WalkValues(step, place);
        if (difference)
            std::rethrow_exception(difference);
        if (!isGivenUp && next())
            Compare(number, text(), "the end of the walk");
        Compare(number, result, std::to_string(found));
    }

    void Compare(std::size_t number, std::string const& expected, std::string const& found)
    {
        if (found != expected)
            Compare(LineOf(m_history[number]), expected, found);
    }

    void Compare(std::string const& what, std::string const& expected, std::string const& found)
    {
        ThrowIfDifferent("after " + std::to_string(m_next) + " steps: " + what, expected, found);
    }

    std::vector<STEP> const& m_history;
    OTHER_PROGRAM m_other;  // first: it is a copy of this process
    MODULE_PROGRAM m_here;
    MODULE_MODEL m_model;
    std::size_t m_next = 0;
    int m_walks[STEP::Sessions + 1] = {};  // that run, of each session
};

void LayOut(MemoryFolder const& folder)
{
    SiteClient::MakeSite(folder / "site");
    for (auto const& [name, content] : LocalFiles())
        folder.Write(fs::path("local") / name, content);
    fs::create_directory(folder / "local" / "folder");
    for (int file = 0; file < TicketFiles; ++file)
        folder.Write(TicketFileName(file), EmptyTicket);
}

// Does something in a program of its own that throws DIFFERENCE. Gives that, or how else the program ended;
// nothing if all went well.
std::string DifferenceOf(fs::path const& folder, std::function<void()> const& work)
{
    fs::path const difference = folder / "difference";
    fs::path const messages = folder / "messages";
    ChildProcess program(
        [&](ChildProcess::Report const&)
        {
            alarm(OTHER_PROGRAM::Patience);  // a history takes one second, unless the machine is busy
            // Without a buffer, which would go with a program that dies.
            if (!std::freopen(messages.c_str(), "w", stderr) || std::setvbuf(stderr, nullptr, _IONBF, 0) != 0)
                throw std::runtime_error("no place for messages");
            try
            {
                work();
            }
            catch (DIFFERENCE const& found)
            {
                WriteFile(difference, found.text);
            }
            catch (std::exception const& error)
            {
                WriteFile(difference, error.what());
            }
            _exit(fs::exists(difference) ? 1 : 0);
        });
    int const code = program.Wait();
    if (code == 0)
        return "";
    std::string const what =
        fs::exists(difference) ? ContentOf(difference) : "a program has died, or came to no end";
    return what + "\n--- messages:\n" + (fs::exists(messages) ? ContentOf(messages) : "");
}
}  // namespace

// Programs are never destroyed: threads of the module may still be on their way to a client.
std::string DifferenceIn(std::vector<STEP> const& steps)
{
    MemoryFolder const folder;
    LayOut(folder);
    std::vector<STEP> const history = WithItsEnd(steps);
    fs::path const expected = folder / "expected";
    auto const run = [&] { WriteFile(expected, (new HISTORY_RUN(folder.Path(), history))->Run()); };
    auto const lookAfterwards = [&]
    {
        ThrowIfDifferent("all tickets, in a program that comes later", ContentOf(expected),
                         (new MODULE_PROGRAM(folder.Path(), 2))->Everything());
    };
    std::string const difference = DifferenceOf(folder.Path(), run);
    return difference.empty() ? DifferenceOf(folder.Path(), lookAfterwards) : difference;
}
