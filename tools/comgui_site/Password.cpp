#include "tools/comgui_site/Password.h"

#include "standin/server/files/Descriptor.h"
#include "standin/server/sessions/Password.h"
#include "tools/comgui_site/Interrupts.h"
#include "tools/comgui_site/Trouble.h"
#include "tools/comgui_site/words.h"
#include <algorithm>
#include <cerrno>
#include <fcntl.h>
#include <poll.h>
#include <string.h>
#include <termios.h>
#include <unistd.h>

namespace comgui_site
{
using standin::Password::Secret;

namespace
{
// While it lives the terminal shows nothing but the ends of lines, and Ctrl-Z has no effect: the shell would
// meet a terminal that shows nothing.
class NoEcho
{
public:
    explicit NoEcho(int terminal) : m_terminal(terminal)
    {
        if (tcgetattr(m_terminal, &m_before) != 0)
            Fail();
        termios silent = m_before;
        silent.c_lflag &= ~static_cast<tcflag_t>(ECHO | ECHOE | ECHOK);
        silent.c_lflag |= static_cast<tcflag_t>(ECHONL | ICANON | ISIG);
        silent.c_cc[VSUSP] = _POSIX_VDISABLE;
        if (tcsetattr(m_terminal, TCSAFLUSH, &silent) != 0)
            Fail();
    }
    ~NoEcho() { tcsetattr(m_terminal, TCSAFLUSH, &m_before); }
    NoEcho(NoEcho const&) = delete;
    NoEcho& operator=(NoEcho const&) = delete;

private:
    [[noreturn]] static void Fail()
    {
        throw Trouble("the terminal cannot be kept from showing the password; give it through a pipe");
    }

    int const m_terminal;
    termios m_before{};
};

// Waits for input. Throws Interrupted.
void WaitFor(int input)
{
    pollfd waiting[] = {{input, POLLIN, 0}, {Interrupts::Descriptor(), POLLIN, 0}};
    for (;;)
    {
        int const ready = poll(waiting, 2, -1);
        Interrupts::Check();
        if (ready > 0)
            return;
    }
}

// Byte by byte, so that what stands behind the line is left to others. What is too long is cut, and refused
// by its length.
void ReadLine(int input, Secret& line)
{
    for (;;)
    {
        WaitFor(input);
        char byte = 0;
        ssize_t const count = read(input, &byte, 1);
        if (count < 0 && errno == EINTR)
            continue;
        if (count < 0)
            throw Trouble(std::string("the password cannot be read: ") + strerror(errno) +
                          "; give it through a terminal or a pipe");
        if (count == 0 || byte == '\n')
            return;
        if (!line.IsFull())
            line.Add(byte);
        explicit_bzero(&byte, 1);
    }
}

void Ask(int terminal, std::string const& question, Secret& answer)
{
    [[maybe_unused]] ssize_t written = write(terminal, question.data(), question.size());
    try
    {
        ReadLine(terminal, answer);
    }
    catch (Interrupted const&)
    {
        written = write(terminal, "\n", 1);
        throw;
    }
}

void Check(Secret const& password)
{
    std::string const& text = password.Text();
    if (text.empty())
        throw Trouble("the password is empty; nothing was changed, choose one with at least one character");
    if (std::any_of(text.begin(), text.end(),
                    [](char byte) { return static_cast<unsigned char>(byte) < 0x20 || byte == 0x7F; }))
        throw Trouble("the password has a control character; nothing was changed, choose one without");
    // The record of a login has room for so many.
    if (text.size() > 127)
        throw Trouble("the password has more than 127 bytes; nothing was changed, choose a shorter one");
}

void AskTwice(std::string const& user, Secret& password)
{
    standin::Descriptor const opened(open("/dev/tty", O_RDWR | O_CLOEXEC | O_NOCTTY));
    int const terminal = opened.Number() >= 0 ? opened.Number() : STDIN_FILENO;
    NoEcho const noEcho(terminal);
    Ask(terminal, "New password of " + Cleaned(user) + ": ", password);
    Check(password);
    Secret again;
    Ask(terminal, "The same again: ", again);
    if (password.Text() != again.Text())
        throw Trouble("the two passwords differ; nothing was changed, try again");
}
}  // namespace

std::string HashOfNewPassword(std::string const& user)
{
    Secret password;
    if (isatty(STDIN_FILENO) == 1)
        AskTwice(user, password);
    else
    {
        ReadLine(STDIN_FILENO, password);
        Check(password);
    }
    try
    {
        return standin::Password::Hash(password.Text());
    }
    catch (std::runtime_error const& error)
    {
        throw Trouble(std::string(error.what()) + "; nothing was changed");
    }
}
}  // namespace comgui_site
