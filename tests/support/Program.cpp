#include "tests/support/Program.h"

#include <cerrno>
#include <fcntl.h>
#include <filesystem>
#include <poll.h>
#include <spawn.h>
#include <sys/wait.h>
#include <system_error>
#include <unistd.h>

extern char** environ;

namespace
{
void Must(int error, std::string const& what)
{
    if (error != 0)
        throw std::system_error(error, std::generic_category(), what);
}

// Both ends are closed in whatever is started: a program that held an end of another's pipe would keep its
// reader from seeing that the other has died.
struct Pipe
{
    Pipe() { Must(pipe2(ends, O_CLOEXEC) == 0 ? 0 : errno, "cannot make a pipe"); }

    int ends[2];
};

class Attributes
{
public:
    Attributes()
    {
        sigset_t defaults;
        sigemptyset(&defaults);
        sigaddset(&defaults, SIGPIPE);
        posix_spawnattr_init(&m_value);
        posix_spawnattr_setsigdefault(&m_value, &defaults);
        posix_spawnattr_setflags(&m_value, POSIX_SPAWN_SETSIGDEF);
    }
    ~Attributes() { posix_spawnattr_destroy(&m_value); }
    Attributes(Attributes const&) = delete;
    Attributes& operator=(Attributes const&) = delete;

    posix_spawnattr_t const* Get() const { return &m_value; }

private:
    posix_spawnattr_t m_value;
};

class Actions
{
public:
    Actions(int input, int output)
    {
        posix_spawn_file_actions_init(&m_value);
        posix_spawn_file_actions_adddup2(&m_value, input, STDIN_FILENO);
        posix_spawn_file_actions_adddup2(&m_value, output, STDOUT_FILENO);
    }
    ~Actions() { posix_spawn_file_actions_destroy(&m_value); }
    Actions(Actions const&) = delete;
    Actions& operator=(Actions const&) = delete;

    posix_spawn_file_actions_t const* Get() const { return &m_value; }

private:
    posix_spawn_file_actions_t m_value;
};
}  // namespace

Program::Program(std::vector<std::string> command)
{
    std::signal(SIGPIPE, SIG_IGN);
    Pipe const input;
    Pipe const output;
    std::vector<char*> arguments;
    for (std::string& argument : command)
        arguments.push_back(argument.data());
    arguments.push_back(nullptr);
    int const error = posix_spawn(&m_id, arguments[0], Actions(input.ends[0], output.ends[1]).Get(),
                                  Attributes().Get(), arguments.data(), environ);
    close(input.ends[0]);
    close(output.ends[1]);
    m_input = input.ends[1];
    m_output = output.ends[0];
    if (error != 0)
    {
        close(m_input);
        close(m_output);
        Must(error, "cannot start " + command[0]);
    }
}

Program::~Program()
{
    Kill();
    close(m_input);
    close(m_output);
}

std::string Program::OwnFile() { return std::filesystem::read_symlink("/proc/self/exe").string(); }

bool Program::Say(std::string_view line)
{
    std::string text(line);
    text += '\n';
    for (std::size_t sent = 0; sent < text.size();)
    {
        ssize_t const size = write(m_input, text.data() + sent, text.size() - sent);
        if (size < 0 && errno != EINTR)
            return false;
        sent += size > 0 ? static_cast<std::size_t>(size) : 0;
    }
    return true;
}

std::optional<std::string> Program::TakeLine()
{
    std::size_t const end = m_text.find('\n', m_searched);
    m_searched = m_text.size();
    if (end == m_text.npos)
        return std::nullopt;
    std::string line = m_text.substr(0, end);
    m_text.erase(0, end + 1);
    m_searched = 0;
    return line;
}

std::optional<std::string> Program::Line(Clock::time_point deadline)
{
    for (;;)
    {
        if (auto line = TakeLine())
            return line;
        if (m_hasEnded)
            return std::nullopt;
        auto const left = std::chrono::ceil<std::chrono::milliseconds>(deadline - Clock::now());
        pollfd output{m_output, POLLIN, 0};
        int const ready = poll(&output, 1, static_cast<int>(std::max<std::int64_t>(left.count(), 0)));
        if (ready == 0)
            return std::nullopt;
        if (ready < 0)
            continue;
        char bytes[4096];
        ssize_t const size = read(m_output, bytes, sizeof bytes);
        if (size > 0)
            m_text.append(bytes, static_cast<std::size_t>(size));
        else
            m_hasEnded = size == 0 || errno != EINTR;
    }
}

void Program::Kill()
{
    if (m_id < 0)
        return;
    kill(m_id, SIGKILL);
    Wait();
}

int Program::Wait()
{
    if (m_id < 0)
        return -1;
    int status = 0;
    while (waitpid(m_id, &status, 0) < 0 && errno == EINTR)
        ;
    m_id = -1;
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}
