#include "tests/module/OtherProgram.h"

#include "tests/module/ModuleProgram.h"
#include <stdexcept>
#include <sys/socket.h>
#include <system_error>
#include <unistd.h>

namespace
{
std::array<int, 2> NewChannel()
{
    std::array<int, 2> ends{};
    if (socketpair(AF_UNIX, SOCK_STREAM, 0, ends.data()) != 0)
        throw std::system_error(errno, std::generic_category(), "no way to a second program");
    return ends;
}

// False once the other side is gone.
bool Receive(int channel, void* to, std::size_t size)
{
    return size == 0 || recv(channel, to, size, MSG_WAITALL) == static_cast<ssize_t>(size);
}

bool Send(int channel, void const* from, std::size_t size)
{
    for (auto const* next = static_cast<char const*>(from); size > 0;)
    {
        ssize_t const sent = send(channel, next, size, MSG_NOSIGNAL);
        if (sent < 0)
            return false;
        next += sent;
        size -= static_cast<std::size_t>(sent);
    }
    return true;
}
}  // namespace

OTHER_PROGRAM::OTHER_PROGRAM(std::filesystem::path const& folder, std::vector<STEP> const& history)
    : m_channel(NewChannel()), m_program(
                                   [&](ChildProcess::Report const&)
                                   {
                                       close(m_channel[0]);
                                       Serve(m_channel[1], folder, history);
                                   })
{
    close(m_channel[1]);
}

OTHER_PROGRAM::~OTHER_PROGRAM() { close(m_channel[0]); }

void OTHER_PROGRAM::End()
{
    shutdown(m_channel[0], SHUT_RDWR);
    m_program.Wait();
}

void OTHER_PROGRAM::Serve(int channel, std::filesystem::path const& folder, std::vector<STEP> const& history)
{
    alarm(Patience);
    auto& program = *new MODULE_PROGRAM(folder, 1);  // never destroyed: threads of the module use it
    for (int question = 0; Receive(channel, &question, sizeof question);)
    {
        std::string const answer = question == AskForNews ? program.News()
                                   : question == AskForEverything
                                       ? program.Everything()
                                       : program.Run(history.at(static_cast<std::size_t>(question)));
        std::size_t const size = answer.size();
        Send(channel, &size, sizeof size);
        Send(channel, answer.data(), size);
    }
}

std::string OTHER_PROGRAM::Ask(int question)
{
    std::size_t size = 0;
    bool const isAnswered =
        Send(m_channel[0], &question, sizeof question) && Receive(m_channel[0], &size, sizeof size);
    std::string answer(isAnswered ? size : 0, '?');
    if (!isAnswered || !Receive(m_channel[0], answer.data(), size))
        throw std::runtime_error("the second program is gone");
    return answer;
}
