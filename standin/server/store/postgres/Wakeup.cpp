#include "standin/server/store/postgres/Wakeup.h"

#include "standin/server/store/Store.h"
#include <cerrno>
#include <fcntl.h>
#include <system_error>
#include <unistd.h>

namespace standin::postgres
{
namespace
{
// Some systems have no call that does all at once.
bool MakePipe(int (&ends)[2])
{
#ifdef __linux__
    return pipe2(ends, O_CLOEXEC | O_NONBLOCK) == 0;
#else
    if (pipe(ends) != 0)
        return false;
    for (int const end : ends)
    {
        fcntl(end, F_SETFD, FD_CLOEXEC);
        fcntl(end, F_SETFL, O_NONBLOCK);
    }
    return true;
#endif
}
}  // namespace

Wakeup::Wakeup()
{
    int ends[2];
    if (!MakePipe(ends))
        throw StoreError("cannot make a pipe (" + std::generic_category().message(errno) +
                         "); close some files, then try again");
    m_wokenEnd = Descriptor(ends[0]);
    m_wakingEnd = Descriptor(ends[1]);
}

// A full pipe wakes as well.
void Wakeup::Wake() noexcept { [[maybe_unused]] ssize_t const ignored = write(m_wakingEnd.Number(), "", 1); }

void Wakeup::Clear() noexcept
{
    char bytes[64];
    while (read(m_wokenEnd.Number(), bytes, sizeof bytes) > 0)
        ;
}
}  // namespace standin::postgres
