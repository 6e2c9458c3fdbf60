#include "tests/support/ChildProcess.h"

#include <cerrno>
#include <csignal>
#include <sys/wait.h>
#include <system_error>
#include <unistd.h>

ChildProcess::ChildProcess(std::function<void(Report const& report)> const& work)
{
    int ends[2];
    if (pipe(ends) != 0 || (m_id = fork()) < 0)
        throw std::system_error(errno, std::generic_category(), "cannot start a child process");
    if (m_id == 0)
    {
        close(ends[0]);
        int code = 0;
        try
        {
            work(
                [&ends](std::int64_t number)
                {
                    if (write(ends[1], &number, sizeof number) != sizeof number)
                        _exit(1);
                });
        }
        catch (...)
        {
            code = 1;
        }
        _exit(code);
    }
    close(ends[1]);
    m_reports = ends[0];
}

ChildProcess::~ChildProcess()
{
    Kill();
    close(m_reports);
}

void ChildProcess::Kill()
{
    if (m_id < 0)
        return;
    kill(m_id, SIGKILL);
    Wait();
}

int ChildProcess::Wait()
{
    int status = 0;
    waitpid(m_id, &status, 0);
    m_id = -1;
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

std::optional<std::int64_t> ChildProcess::Next()
{
    std::int64_t number = 0;
    if (read(m_reports, &number, sizeof number) != sizeof number)
        return std::nullopt;
    return number;
}

std::int64_t ChildProcess::Last(std::int64_t otherwise)
{
    while (std::optional<std::int64_t> const number = Next())
        otherwise = *number;
    return otherwise;
}
