#include "standin/trace/Trace.h"

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <condition_variable>
#include <cstdio>
#include <cstdlib>
#include <fcntl.h>
#include <mutex>
#include <pthread.h>
#include <string_view>
#include <sys/syscall.h>
#include <thread>
#include <unistd.h>
#include <vector>

namespace trace
{
namespace
{
constexpr std::chrono::milliseconds BetweenWrites(5);

std::uint32_t ThisThread() noexcept
{
    static thread_local std::uint32_t const id = static_cast<std::uint32_t>(syscall(SYS_gettid));
    return id;
}

void Complain(std::string const& file, char const* what)
{
    std::fprintf(stderr, "ComGUI-Trace: %s: %s: %s; nothing is traced\n", file.c_str(), what,
                 std::generic_category().message(errno).c_str());
}

std::string FileName()
{
    char const* const given = std::getenv("COMGUI_TRACE_FILE");
    std::string name = given && *given ? given : "comgui-%p.trace";
    if (std::size_t const at = name.find("%p"); at != std::string::npos)
        name.replace(at, 2, std::to_string(getpid()));
    // The file of another process that runs, or has died, is not ours to write.
    if (access((name + RingSuffix).c_str(), F_OK) == 0)
        name += "." + std::to_string(getpid());
    return name;
}

bool IsAboutAPassword(char const* key) noexcept { return key && strcasestr(key, "password"); }
}  // namespace

// Takes the records out of the ring every few milliseconds.
class Trace::Writer
{
public:
    Writer(TraceRing& ring, int file, std::string ringFile)
        : m_ring(ring), m_file(file), m_ringFile(std::move(ringFile)), m_thread([this] { Run(); })
    {
    }

    // The last records, and nothing is left of the ring.
    ~Writer()
    {
        if (m_process != getpid())
        {
            m_thread.detach();
            return;
        }
        {
            std::lock_guard const lock(m_lock);
            m_isStopped = true;
        }
        m_wake.notify_one();
        m_thread.join();
        m_ring.Switch(false);
        Write();
        close(m_file);
        unlink(m_ringFile.c_str());
    }
    Writer(Writer const&) = delete;
    Writer& operator=(Writer const&) = delete;

private:
    void Run()
    {
        std::unique_lock lock(m_lock);
        while (!m_wake.wait_for(lock, BetweenWrites, [this] { return m_isStopped; }))
            Write();
    }

    void Write()
    {
        m_buffer.clear();
        m_ring.TakeAll([this](char const* record, std::size_t size)
                       { m_buffer.insert(m_buffer.end(), record, record + size); });
        if (std::uint64_t const dropped = m_ring.Dropped(); dropped != m_dropped)
        {
            RecordHead const head{sizeof(RecordHead) + 9, Kind::Dropped, Call::Count, 0, 0, 0};
            auto const* const bytes = reinterpret_cast<char const*>(&head);
            m_buffer.insert(m_buffer.end(), bytes, bytes + sizeof head);
            m_buffer.push_back(static_cast<char>(Field::Unsigned64));
            std::uint64_t const more = dropped - m_dropped;
            auto const* const number = reinterpret_cast<char const*>(&more);
            m_buffer.insert(m_buffer.end(), number, number + sizeof more);
            m_dropped = dropped;
        }
        for (std::size_t done = 0; done < m_buffer.size();)
        {
            ssize_t const written = write(m_file, m_buffer.data() + done, m_buffer.size() - done);
            if (written < 0 && errno == EINTR)
                continue;
            if (written <= 0)
                return Fail();
            done += static_cast<std::size_t>(written);
        }
    }

    void Fail()
    {
        if (m_ring.IsOn())
            Complain(m_ringFile.substr(0, m_ringFile.size() - sizeof RingSuffix + 1), "cannot be written");
        m_ring.Switch(false);
    }

    TraceRing& m_ring;
    int const m_file;
    std::string const m_ringFile;
    pid_t const m_process = getpid();
    std::vector<char> m_buffer;
    std::uint64_t m_dropped = 0;
    std::mutex m_lock;
    std::condition_variable m_wake;
    bool m_isStopped = false;
    std::thread m_thread;  // the last: it uses the others
};

Trace& Trace::Get()
{
    static auto& trace = *new Trace;  // calls may come while the process ends
    return trace;
}

Trace::Trace()
{
    std::string const name = FileName();
    int const file = open(name.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0600);
    if (file < 0)
    {
        Complain(name, "cannot be made");
        return;
    }
    m_start = Now();
    timespec wall{};
    clock_gettime(CLOCK_REALTIME, &wall);
    FileHead head{
        {}, m_start, wall.tv_sec * 1'000'000'000 + wall.tv_nsec, static_cast<std::uint32_t>(getpid()), 0};
    std::memcpy(head.magic, FileMagic, sizeof head.magic);
    auto ring = TraceRing::Make(name + RingSuffix);
    if (!ring || write(file, &head, sizeof head) != sizeof head)
    {
        Complain(name, "cannot be written");
        close(file);
        return;
    }
    char const* const wish = std::getenv("COMGUI_TRACE");
    ring->Switch(!wish || std::string_view(wish) != "off");
    m_ring = std::move(ring);
    s_switch = &m_ring->TheSwitch();
    static Writer const writer(*m_ring, file, name + RingSuffix);
    // A child has no writer, and must not write into its parent's ring.
    pthread_atfork(nullptr, nullptr,
                   []
                   {
                       s_switch = &AlwaysOff;
                       (void)Trace::Get().m_ring.release();
                   });
}

Record::Record(Kind kind, Call call, std::uint64_t number) noexcept
    : m_head{sizeof(RecordHead), kind, call, ThisThread(), number, Trace::Get().Now()}
{
}

void Record::Put() noexcept { Trace::Get().Put(this, m_head.size); }

Record& Record::AddText(Field field, char const* bytes, std::size_t size) noexcept
{
    auto const length = static_cast<std::uint32_t>(std::min<std::size_t>(size, UINT32_MAX));
    std::size_t const room = LargestRecord - m_head.size;
    if (room < 7)
        return *this;
    auto const here = static_cast<std::uint16_t>(std::min({size, MostOfAText, room - 7}));
    char* const out = m_fields + (m_head.size - sizeof m_head);
    out[0] = static_cast<char>(field);
    std::memcpy(out + 1, &length, sizeof length);
    std::memcpy(out + 5, &here, sizeof here);
    std::memcpy(out + 7, bytes, here);
    m_head.size = static_cast<std::uint16_t>(m_head.size + 7 + here);
    return *this;
}

Record& Record::Add(char const* text) noexcept
{
    return text ? AddText(Field::Text, text, std::strlen(text)) : AddNone();
}

Record& Record::AddWritten(char const* key, PARAM_TYPE type, void const* word) noexcept
{
    if (type == PARAM_POINTER)
        return Add(word);
    if (!word || type == PARAM_NONE || type == PARAM_COUNT)  // of these nobody may follow the word
        return AddNone();
    if (type == PARAM_STRING)
        return AddRead(key, type, &word);
    return AddRead(key, type, word);
}

Record& Record::AddRead(char const* key, PARAM_TYPE type, void const* place) noexcept
{
    if (!place)
        return AddNone();
    bool const isText = type == PARAM_STRING || type == PARAM_BINSTRING;
    if (isText && IsAboutAPassword(key))
        return AddBytes(Field::Hidden, nullptr, 0);
    switch (type)
    {
    case PARAM_NONE:  // the stored type
    case PARAM_INT:
        return AddBytes(Field::Int, place, 4);
    case PARAM_UNSIGNED:
        return AddBytes(Field::Unsigned, place, 4);
    case PARAM_DOUBLE:
        return AddBytes(Field::Double, place, 8);
    case PARAM_INT64:
        return AddBytes(Field::Int64, place, 8);
    case PARAM_COUNT:
    case PARAM_UNSIGNED64:
        return AddBytes(Field::Unsigned64, place, 8);
    case PARAM_POINTER:
        return AddBytes(Field::Pointer, place, 8);
    case PARAM_STRING:
        return Add(*static_cast<char const* const*>(place));
    case PARAM_BINSTRING:
    {
        auto const& bytes = *static_cast<BIN_STRING const*>(place);
        return bytes.data ? AddText(Field::Bytes, static_cast<char const*>(bytes.data), bytes.size)
                          : AddNone();
    }
    }
    return AddNone();
}
}  // namespace trace
