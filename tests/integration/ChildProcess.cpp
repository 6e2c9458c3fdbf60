#include "tests/integration/ChildProcess.h"

#include <csignal>
#include <stdexcept>
#include <sys/wait.h>
#include <unistd.h>

ChildProcess::ChildProcess(std::function<void(std::function<void(int)> const& tell)> const& work)
{
    int ends[2];
    if (pipe(ends) != 0 || (m_id = fork()) < 0)
        throw std::runtime_error("cannot start a child process");
    if (m_id == 0)
    {
        close(ends[0]);
        work(
            [&](int number)
            {
                if (write(ends[1], &number, sizeof number) != sizeof number)
                    _exit(1);
            });
        _exit(0);
    }
    close(ends[1]);
    m_numbers = ends[0];
}

ChildProcess::~ChildProcess()
{
    Kill();
    close(m_numbers);
}

std::optional<int> ChildProcess::Next()
{
    int number = 0;
    if (read(m_numbers, &number, sizeof number) != sizeof number)
        return std::nullopt;
    return number;
}

void ChildProcess::Kill()
{
    if (m_id <= 0)
        return;
    kill(m_id, SIGKILL);
    waitpid(m_id, nullptr, 0);
    m_id = 0;
}
