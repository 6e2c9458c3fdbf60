// Gigabytes of zero bytes of which only those take memory that are touched, for sizes at the borders of 32
// bits.
#pragma once

#include <cstring>
#include <new>
#include <string>
#include <sys/mman.h>

class AddressSpace
{
public:
    explicit AddressSpace(unsigned long size)
        : m_bytes(mmap(nullptr, size, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1,
                       0)),
          m_size(size)
    {
        if (m_bytes == MAP_FAILED)
            throw std::bad_alloc();
    }
    ~AddressSpace() { munmap(m_bytes, m_size); }
    AddressSpace(AddressSpace const&) = delete;
    AddressSpace& operator=(AddressSpace const&) = delete;

    void Put(unsigned long at, std::string const& bytes)
    {
        std::memcpy(static_cast<char*>(m_bytes) + at, bytes.data(), bytes.size());
    }

    void const* Data() const { return m_bytes; }
    unsigned long Size() const { return m_size; }

private:
    void* m_bytes;
    unsigned long m_size;
};
