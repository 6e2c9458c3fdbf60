// Somebody outside who reads texts and keeps their addresses: the mark that he leaves on each, and how many
// he has read. For any thread.
#pragma once

#include <atomic>
#include <cstdint>

namespace standin
{
class TextReader
{
public:
    explicit TextReader(std::uint64_t marks = 0) : m_marks(marks) {}
    TextReader(TextReader const&) = delete;
    TextReader& operator=(TextReader const&) = delete;

    // One bit; 0: his reading leaves no trace. Set before he reads.
    void SetMark(std::uint64_t mark) { m_marks = mark; }
    std::uint64_t Mark() const { return m_marks; }

    // A thread counts a batch at a time, and loses the rest of one when it reads for another reader: what is
    // counted may be less than what was read, and never more.
    void NoteRead() noexcept
    {
        Batch& batch = s_batch;
        if (batch.reader != m_number)
        {
            batch = {m_number, 0};
            m_reads.fetch_add(1, std::memory_order_relaxed);
        }
        else if (++batch.reads == BatchSize)
        {
            batch.reads = 0;
            m_reads.fetch_add(BatchSize, std::memory_order_relaxed);
        }
    }
    std::uint64_t Reads() const { return m_reads.load(std::memory_order_relaxed); }

    // While it lives a walk is under way, which has read all its texts at the beginning and hands them out
    // one by one, however long that takes.
    class Walk
    {
    public:
        explicit Walk(TextReader& reader) : m_reader(reader) { m_reader.m_walks.fetch_add(1); }
        ~Walk() { m_reader.m_walks.fetch_sub(1); }
        Walk(Walk const&) = delete;
        Walk& operator=(Walk const&) = delete;

    private:
        TextReader& m_reader;
    };
    bool IsWalking() const { return m_walks.load() != 0; }

private:
    static constexpr std::uint64_t BatchSize = 64;

    // What a thread has read and not counted yet, of the reader that it read for last.
    struct Batch
    {
        std::uint64_t reader;
        std::uint64_t reads;
    };
#ifdef __GLIBC__
    // Without this a plug-in's thread_local costs a call.
    [[gnu::tls_model("initial-exec")]]
#endif
    static inline thread_local constinit Batch s_batch{};
    static inline std::atomic<std::uint64_t> s_newest{0};

    std::uint64_t const m_number = s_newest.fetch_add(1, std::memory_order_relaxed) + 1;  // none twice
    std::uint64_t m_marks;
    std::atomic<std::uint64_t> m_reads{0};
    std::atomic<unsigned> m_walks{0};
};
}  // namespace standin
