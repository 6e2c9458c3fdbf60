#include "tools/comgui_site/Interrupts.h"

#include "tools/comgui_site/Trouble.h"
#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <fcntl.h>
#include <unistd.h>

namespace comgui_site
{
namespace
{
volatile std::sig_atomic_t request = 0;
int ends[2] = {-1, -1};

void Note(int signal)
{
    int const error = errno;
    request = signal;
    [[maybe_unused]] ssize_t const written = write(ends[1], "", 1);  // a full pipe can be read, too
    errno = error;
}
}  // namespace

void Interrupts::Watch()
{
    if (pipe2(ends, O_CLOEXEC | O_NONBLOCK) != 0)
        throw Trouble("no pipe can be made; end other programs, then try again");
    std::signal(SIGPIPE, SIG_IGN);
    std::signal(SIGXFSZ, SIG_IGN);
    for (int const signal : {SIGINT, SIGTERM, SIGHUP, SIGQUIT})
    {
        struct sigaction before = {};
        sigaction(signal, nullptr, &before);
        if (before.sa_handler == SIG_IGN)
            continue;
        struct sigaction action = {};
        action.sa_handler = &Note;
        action.sa_flags = static_cast<int>(SA_RESETHAND);
        sigaction(signal, &action, nullptr);
    }
}

bool Interrupts::HaveCome() noexcept { return request != 0; }

void Interrupts::Check()
{
    if (HaveCome())
        throw Interrupted();
}

int Interrupts::Descriptor() { return ends[0]; }

void Interrupts::End()
{
    std::signal(request, SIG_DFL);
    std::raise(request);
    std::_Exit(1);
}
}  // namespace comgui_site
