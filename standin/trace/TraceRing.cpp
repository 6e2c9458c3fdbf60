#include "standin/trace/TraceRing.h"

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

namespace trace
{
namespace
{
constexpr char RingMagic[8] = {'C', 'G', 'R', 'I', 'N', 'G', '_', '1'};
}

void* TraceRing::Map(int descriptor) noexcept
{
    void* const memory = mmap(nullptr, Size, PROT_READ | PROT_WRITE, MAP_SHARED, descriptor, 0);
    return memory == MAP_FAILED ? nullptr : memory;
}

std::unique_ptr<TraceRing> TraceRing::Make(std::string const& file)
{
    int const descriptor = open(file.c_str(), O_RDWR | O_CREAT | O_TRUNC | O_CLOEXEC, 0600);
    if (descriptor < 0)
        return nullptr;
    bool const hasRoom =
        posix_fallocate(descriptor, 0, Size) == 0;  // a full disk would end the program later
    void* const memory = hasRoom ? Map(descriptor) : nullptr;
    close(descriptor);
    if (!memory)
    {
        unlink(file.c_str());
        return nullptr;
    }
    std::unique_ptr<TraceRing> ring(new TraceRing(memory));
    for (std::uint32_t i = 0; i < Slots; ++i)
        ring->m_slots[i].turn.store(i, std::memory_order_relaxed);
    std::memcpy(ring->m_head->magic, RingMagic, sizeof RingMagic);
    return ring;
}

std::unique_ptr<TraceRing> TraceRing::Open(std::string const& file)
{
    int const descriptor = open(file.c_str(), O_RDWR | O_CLOEXEC);
    if (descriptor < 0)
        return nullptr;
    struct stat status
    {
    };
    bool const isWhole = fstat(descriptor, &status) == 0 && status.st_size == static_cast<off_t>(Size);
    void* const memory = isWhole ? Map(descriptor) : nullptr;
    close(descriptor);
    if (!memory)
        return nullptr;
    std::unique_ptr<TraceRing> ring(new TraceRing(memory));
    bool const isRing = std::memcmp(ring->m_head->magic, RingMagic, sizeof RingMagic) == 0;
    return isRing ? std::move(ring) : nullptr;
}

TraceRing::~TraceRing() { munmap(m_head, Size); }
}  // namespace trace
