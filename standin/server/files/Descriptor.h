// An open file or folder of the operating system; closed with its owner. -1 for none. Never one of the three
// of standard input and output, which a program may have been started without: what it prints would go into
// the file.
#pragma once

#include <cerrno>
#include <fcntl.h>
#include <unistd.h>
#include <utility>

namespace standin
{
class Descriptor
{
public:
    explicit Descriptor(int number = -1) : m_number(AboveStandardOnes(number)) {}
    ~Descriptor()
    {
        if (m_number >= 0)
            close(m_number);
    }
    Descriptor(Descriptor&& other) noexcept : m_number(std::exchange(other.m_number, -1)) {}
    Descriptor& operator=(Descriptor&& other) noexcept
    {
        std::swap(m_number, other.m_number);
        return *this;
    }
    int Number() const { return m_number; }

    // For who has written: what did not reach a disk elsewhere, or is above a quota, may turn out only now.
    // False if so, and errno tells why; closed it is all the same.
    bool Close() { return close(std::exchange(m_number, -1)) == 0; }

private:
    // errno is as it was for one that is -1 already.
    static int AboveStandardOnes(int number)
    {
        if (number < 0 || number > STDERR_FILENO)
            return number;
        int const above = fcntl(number, F_DUPFD_CLOEXEC, STDERR_FILENO + 1);
        int const error = errno;
        close(number);
        errno = error;
        return above;
    }

    int m_number;
};
}  // namespace standin
