#include "tools/comgui_validate/Run.h"

#include "tools/comgui_validate/Trial.h"
#include "tools/shared/Trouble.h"
#include <array>
#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <nlohmann/json.hpp>
#include <poll.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

namespace validate
{
namespace
{
using Clock = std::chrono::steady_clock;
using Json = nlohmann::json;
using namespace std::chrono_literals;

constexpr std::size_t MostOutput = 4000;
constexpr char NoEnd[] = "the end of the process";

void TellFailure(char const* what) { throw tools::Trouble(std::string(what) + ": " + std::strerror(errno)); }

// Texts of a plug-in may be anything.
std::string ToText(Json const& json) { return json.dump(-1, ' ', false, Json::error_handler_t::replace); }

Json Try(Check const& check, Options const& options, LastCall& lastCall)
{
    try
    {
        Trial trial(options, lastCall);
        check.run(trial);
        return {{"outcome", "passed"}};
    }
    catch (Broken const& broken)
    {
        return {{"outcome", "failed"},
                {"rule", broken.rule},
                {"called", broken.called},
                {"came", broken.came},
                {"due", broken.due}};
    }
    catch (Skipped const& skipped)
    {
        return {{"outcome", "skipped"}, {"reason", skipped.what()}};
    }
    catch (std::exception const& failure)
    {
        return {{"outcome", "failed"},
                {"rule", "G1"},
                {"called", lastCall.Get()},
                {"came", std::string("an exception: ") + failure.what()},
                {"due", "a return"}};
    }
    catch (...)
    {
        return {{"outcome", "failed"},
                {"rule", "G1"},
                {"called", lastCall.Get()},
                {"came", "an exception of an unknown type"},
                {"due", "a return"}};
    }
}

class Child
{
public:
    Child(Check const& check, Options const& options) : m_output(std::tmpfile())
    {
        int pipes[2];
        if (!m_output || pipe(pipes) != 0)
            TellFailure("a check cannot be started");
        std::fflush(nullptr);  // lest the child prints it once more
        m_id = fork();
        if (m_id < 0)
            TellFailure("a check cannot be started");
        if (m_id == 0)
            Live(check, options, pipes[1]);
        close(pipes[1]);
        m_result = pipes[0];
    }
    ~Child()
    {
        if (!m_isOver)
        {
            kill(m_id, SIGKILL);
            waitpid(m_id, nullptr, 0);
        }
        close(m_result);
        std::fclose(m_output);
    }
    Child(Child const&) = delete;
    Child& operator=(Child const&) = delete;

    // What the check has found; none if the process has ended without a word, or the time is over.
    std::optional<Json> Result(Clock::time_point end)
    {
        std::string text;
        std::array<char, 4096> piece;
        pollfd waiting{m_result, POLLIN, 0};
        while (true)
        {
            auto const left = std::chrono::ceil<std::chrono::milliseconds>(end - Clock::now());
            if (left <= 0ms || poll(&waiting, 1, static_cast<int>(left.count())) == 0)
                return std::nullopt;
            ssize_t const size = read(m_result, piece.data(), piece.size());
            if (size == 0)
                break;
            if (size > 0)
                text.append(piece.data(), static_cast<std::size_t>(size));
        }
        Json json = Json::parse(text, nullptr, false);
        return json.is_discarded() ? std::nullopt : std::optional(std::move(json));
    }

    // How the process has ended in that time, in words; empty if it was in order.
    std::string End(Clock::time_point end)
    {
        int status = 0;
        while (waitpid(m_id, &status, WNOHANG) == 0)
        {
            if (Clock::now() > end)
                return "no return";
            std::this_thread::sleep_for(1ms);
        }
        m_isOver = true;
        if (WIFSIGNALED(status))
            return std::string("the process ended by the signal ") + strsignal(WTERMSIG(status));
        return WEXITSTATUS(status) == 0
                   ? ""
                   : "the process ended with status " + std::to_string(WEXITSTATUS(status));
    }

    std::string Output() const
    {
        std::string text(MostOutput, '\0');
        std::rewind(m_output);
        text.resize(std::fread(text.data(), 1, text.size(), m_output));
        return text;
    }
    std::string LastCallOf() const { return m_lastCall.Get(); }

private:
    // The end is that of a host: a plug-in may do something then, too.
    [[noreturn]] void Live(Check const& check, Options const& options, int result)
    {
        dup2(fileno(m_output), STDOUT_FILENO);
        dup2(fileno(m_output), STDERR_FILENO);
        std::string const text = ToText(Try(check, options, m_lastCall));
        m_lastCall.Set(NoEnd);
        for (std::size_t done = 0; done < text.size();)
        {
            ssize_t const size = write(result, text.data() + done, text.size() - done);
            if (size < 0)
                _exit(1);
            done += static_cast<std::size_t>(size);
        }
        close(result);
        std::exit(0);
    }

    LastCall m_lastCall;
    std::FILE* m_output;
    pid_t m_id = -1;
    int m_result = -1;
    bool m_isOver = false;
};

std::string TextOf(Json const& json, char const* name) { return json.value(name, std::string()); }

Verdict VerdictOf(Json const& json)
{
    std::string const outcome = TextOf(json, "outcome");
    if (outcome == "failed")
        return {Outcome::Failed,
                {TextOf(json, "rule"), TextOf(json, "called"), TextOf(json, "came"), TextOf(json, "due")}};
    if (outcome == "skipped")
        return {Outcome::Skipped, {}, TextOf(json, "reason")};
    return {};
}

Verdict Judge(Child& child, std::chrono::milliseconds limit)
{
    auto const end = Clock::now() + limit;
    auto const found = child.Result(end);
    if (found && TextOf(*found, "outcome") == "failed")
        return VerdictOf(*found);
    std::string const ending = child.End(found ? std::max(end, Clock::now() + 1s) : end);
    if (found && ending.empty())
        return VerdictOf(*found);
    std::string const came = ending == "no return"
                                 ? "no return within " + std::to_string(limit.count() / 1000) + " s"
                                 : (ending.empty() ? "the end of the process" : ending);
    return {Outcome::Failed, {"G1", child.LastCallOf(), came, "a return"}};
}
}  // namespace

Verdict Run(Check const& check, Options const& options)
{
    auto const start = Clock::now();
    Child child(check, options);
    Verdict verdict = Judge(child, options.limit);
    verdict.output = child.Output();
    verdict.time = Clock::now() - start;
    return verdict;
}
}  // namespace validate
