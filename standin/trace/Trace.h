// The trace of this process: whether it is wanted, the ring that calls are put into, and the thread that
// writes them to the file. COMGUI_TRACE_FILE names the file, %p in it stands for the process; without it the
// name is comgui-%p.trace in the current folder. COMGUI_TRACE=off begins switched off.
//
// For any thread. In a child made by fork nothing is traced.
#pragma once

#include "comgui/ticket/BIN_STRING.h"
#include "comgui/ticket/PARAM_TYPE.h"
#include "standin/trace/TraceRing.h"
#include <ctime>

namespace trace
{
class Trace
{
public:
    // Made at the first call; ends its work at the end of the process.
    static Trace& Get();

    // False before the trace is made, too.
    static bool IsOn() noexcept
    {
        return s_switch.load(std::memory_order_relaxed)->load(std::memory_order_relaxed) != 0;
    }
    void Switch(bool on) noexcept
    {
        if (m_ring)
            m_ring->Switch(on);
    }
    std::uint64_t NextNumber() noexcept { return m_number.fetch_add(1, std::memory_order_relaxed); }
    std::uint64_t Now() const noexcept
    {
        timespec now{};
        clock_gettime(CLOCK_MONOTONIC, &now);
        return static_cast<std::uint64_t>(now.tv_sec) * 1'000'000'000 +
               static_cast<std::uint64_t>(now.tv_nsec) - m_start;
    }
    void Put(void const* record, std::size_t size) noexcept { m_ring->Put(record, size); }

private:
    class Writer;

    Trace();

    static constexpr std::atomic<std::uint32_t> AlwaysOff{0};
    static inline constinit std::atomic<std::atomic<std::uint32_t> const*> s_switch{&AlwaysOff};

    std::unique_ptr<TraceRing> m_ring;  // null: nothing can be traced
    std::uint64_t m_start = 0;
    std::atomic<std::uint64_t> m_number{1};
};

// One record while it is made.
class Record
{
public:
    Record(Kind kind, Call call, std::uint64_t number) noexcept;

    Record& Add(int number) noexcept { return AddBytes(Field::Int, &number, sizeof number); }
    Record& Add(unsigned number) noexcept { return AddBytes(Field::Unsigned, &number, sizeof number); }
    Record& Add(std::uint64_t number) noexcept { return AddBytes(Field::Unsigned64, &number, sizeof number); }
    Record& Add(void const* pointer) noexcept { return AddBytes(Field::Pointer, &pointer, sizeof pointer); }
    Record& Add(char const* text) noexcept;  // null: none

    // A value as the word of a write, or what a read has put into its place. Texts and bytes under a key that
    // speaks of a password are hidden.
    Record& AddWritten(char const* key, PARAM_TYPE type, void const* word) noexcept;
    Record& AddRead(char const* key, PARAM_TYPE type, void const* place) noexcept;
    Record& AddNone() noexcept { return AddBytes(Field::None, nullptr, 0); }

    void Put() noexcept;

private:
    Record& AddBytes(Field field, void const* bytes, std::size_t size) noexcept
    {
        if (m_head.size + 1 + size > LargestRecord)
            return *this;
        char* const out = m_fields + (m_head.size - sizeof m_head);
        *out = static_cast<char>(field);
        if (size)
            std::memcpy(out + 1, bytes, size);
        m_head.size = static_cast<std::uint16_t>(m_head.size + 1 + size);
        return *this;
    }
    Record& AddText(Field field, char const* bytes, std::size_t size) noexcept;

    RecordHead m_head;
    char m_fields[LargestRecord - sizeof(RecordHead)];
};
static_assert(sizeof(Record) == LargestRecord);

// A call under way: what it is told at its beginning and its end is written if the trace was on then.
class TracedCall
{
public:
    explicit TracedCall(Call call) noexcept : m_call(call)
    {
        if (Trace::IsOn())
            m_number = Trace::Get().NextNumber();
    }

    bool IsTraced() const noexcept { return m_number != 0; }
    template <typename... Arguments>
    void Began(Arguments... arguments) const noexcept
    {
        if (IsTraced())
            PutAll(Kind::Began, arguments...);
    }
    template <typename... Results>
    void Ended(Results... results) const noexcept
    {
        if (IsTraced())
            PutAll(Kind::Ended, results...);
    }
    Record Make(Kind kind) const noexcept { return {kind, m_call, m_number}; }

private:
    template <typename... Fields>
    [[gnu::noinline]] void PutAll(Kind kind, Fields... fields) const noexcept
    {
        Record record = Make(kind);
        (record.Add(fields), ...);
        record.Put();
    }

    Call const m_call;
    std::uint64_t m_number = 0;
};
}  // namespace trace
