#include "tools/comgui_trace/TraceFile.h"

#include "standin/trace/TraceRing.h"
#include "tools/shared/Trouble.h"
#include "tools/shared/text.h"
#include <algorithm>
#include <csignal>
#include <cstring>
#include <optional>

namespace tracing
{
namespace
{
using tools::Trouble;

// Takes fields off the front of a record; nothing where it is not one.
class FieldReader
{
public:
    explicit FieldReader(std::string_view bytes) : m_bytes(bytes) {}

    bool IsAtEnd() const { return m_bytes.empty(); }
    std::optional<Field> Next()
    {
        auto const kind = static_cast<trace::Field>(m_bytes[0]);
        m_bytes.remove_prefix(1);
        switch (kind)
        {
        case trace::Field::None:
            return None();
        case trace::Field::Hidden:
            return Hidden();
        case trace::Field::Int:
            return Number<int, int>();
        case trace::Field::Unsigned:
            return Number<unsigned, unsigned>();
        case trace::Field::Int64:
            return Number<std::int64_t, long long>();
        case trace::Field::Unsigned64:
            return Number<std::uint64_t, unsigned long long>();
        case trace::Field::Double:
            return Number<double, double>();
        case trace::Field::Pointer:
            return Number<std::uint64_t, Address>();
        case trace::Field::Text:
        case trace::Field::Bytes:
            return OfText(kind == trace::Field::Bytes);
        }
        return std::nullopt;
    }

private:
    template <typename Stored, typename Shown>
    std::optional<Field> Number()
    {
        Stored number;
        if (!Take(&number, sizeof number))
            return std::nullopt;
        return Shown{number};
    }

    std::optional<Field> OfText(bool isBytes)
    {
        std::uint32_t length = 0;
        std::uint16_t here = 0;
        if (!Take(&length, sizeof length) || !Take(&here, sizeof here) || m_bytes.size() < here)
            return std::nullopt;
        Text text{std::string(m_bytes.substr(0, here)), length, isBytes};
        m_bytes.remove_prefix(here);
        return text;
    }

    bool Take(void* out, std::size_t size)
    {
        if (m_bytes.size() < size)
            return false;
        std::memcpy(out, m_bytes.data(), size);
        m_bytes.remove_prefix(size);
        return true;
    }

    std::string_view m_bytes;
};

// Nothing if it is none that a trace has.
std::optional<Record> Parsed(std::string_view bytes)
{
    Record record;
    std::memcpy(&record.head, bytes.data(), sizeof record.head);
    bool const isKind = record.head.kind >= trace::Kind::Began && record.head.kind <= trace::Kind::Dropped;
    if (!isKind || (record.head.kind != trace::Kind::Dropped && record.head.call >= trace::Call::Count))
        return std::nullopt;
    FieldReader reader(bytes.substr(sizeof record.head));
    while (!reader.IsAtEnd())
    {
        auto field = reader.Next();
        if (!field)
            return std::nullopt;
        record.fields.push_back(std::move(*field));
    }
    return record;
}

bool IsSize(std::size_t size) { return size >= sizeof(trace::RecordHead) && size <= trace::LargestRecord; }

bool IsGood(trace::CallText const& text, std::vector<Field> const& results)
{
    if (results.empty())
        return true;
    if (auto const* const number = std::get_if<int>(&results[0]))
        return text.isZeroGood ? *number == 0 : *number != 0;
    if (auto const* const address = std::get_if<Address>(&results[0]))
        return address->number != 0;
    return true;
}
}  // namespace

TraceFile::TraceFile(std::string name) : m_name(std::move(name)), m_file(m_name, std::ios::binary)
{
    if (!m_file)
        throw Trouble(tools::ShownName(m_name) + " cannot be read");
    m_file.read(reinterpret_cast<char*>(&m_head), sizeof m_head);
    bool const isTrace = m_file && std::memcmp(m_head.magic, trace::FileMagic, sizeof m_head.magic) == 0;
    if (!isTrace)
        throw Trouble(tools::ShownName(m_name) + " is no trace of this version");
}

bool TraceFile::Next(Record& record)
{
    auto const more = [this](std::size_t size)
    {
        if (m_pending.size() >= size)
            return true;
        std::size_t const had = m_pending.size();
        m_pending.resize(size);
        m_file.clear();  // what was at its end may have grown
        m_file.read(m_pending.data() + had, static_cast<std::streamsize>(size - had));
        m_pending.resize(had + static_cast<std::size_t>(m_file.gcount()));
        return m_pending.size() == size;
    };
    if (!more(sizeof(trace::RecordHead)))
        return false;
    trace::RecordHead head;
    std::memcpy(&head, m_pending.data(), sizeof head);
    if (!IsSize(head.size))
        throw Trouble(tools::ShownName(m_name) + " is damaged");
    if (!more(head.size))
        return false;
    auto parsed = Parsed(m_pending);
    if (!parsed)
        throw Trouble(tools::ShownName(m_name) + " is damaged");
    m_pending.clear();
    record = std::move(*parsed);
    return true;
}

std::vector<Record> TraceFile::Rest() const
{
    std::vector<Record> records;
    bool const runs = kill(static_cast<pid_t>(m_head.process), 0) == 0;
    auto const ring = runs ? nullptr : trace::TraceRing::Open(m_name + trace::RingSuffix);
    if (ring)
        ring->LookAtAll(
            [&records](char const* bytes, std::size_t size)
            {
                if (IsSize(size))
                    if (auto record = Parsed({bytes, size}))
                        records.push_back(std::move(*record));
            });
    return records;
}

void ForEach(std::string const& file, std::function<void(Record const&)> const& take)
{
    TraceFile trace(file);
    for (Record record; trace.Next(record);)
        take(record);
    for (Record const& record : trace.Rest())
        take(record);
}

void CallReader::Add(Record const& record)
{
    if (record.head.kind == trace::Kind::Dropped)
    {
        if (!record.fields.empty())
            if (auto const* const count = std::get_if<unsigned long long>(&record.fields[0]))
                m_dropped += *count;
        return;
    }
    if (record.head.kind == trace::Kind::Began)
    {
        m_open.push_back({record, {}, {}, 0, false, true});
        return;
    }
    // The newest is the likeliest. Without a beginning, the trace was switched on or a record was dropped.
    auto const found =
        std::find_if(m_open.rbegin(), m_open.rend(),
                     [&](TracedCall const& call) { return call.began.head.number == record.head.number; });
    if (found == m_open.rend())
        return;
    if (record.head.kind == trace::Kind::Detail)
    {
        found->details.push_back(record);
        return;
    }
    TracedCall call = std::move(*found);
    m_open.erase(std::next(found).base());
    call.results = record.fields;
    call.duration = record.head.time - call.began.head.time;
    call.hasEnded = true;
    call.isGood = IsGood(TextOf(call.began.head.call), call.results);
    m_take(call);
}

void CallReader::Finish()
{
    for (TracedCall const& call : m_open)
        m_take(call);
    m_open.clear();
}

trace::CallText const& TextOf(trace::Call call) { return trace::CallTexts[static_cast<std::size_t>(call)]; }

std::vector<std::string> NamesIn(char const* list)
{
    std::vector<std::string> names;
    std::string_view rest = list;
    while (!rest.empty())
    {
        std::size_t const comma = std::min(rest.find(','), rest.size());
        names.emplace_back(rest.substr(0, comma));
        rest.remove_prefix(std::min(comma + 1, rest.size()));
    }
    return names;
}
}  // namespace tracing
