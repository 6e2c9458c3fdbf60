// A trace as it is read: records from the file, and from the ring what the program did not come to write.
#pragma once

#include "standin/trace/TraceFormat.h"
#include <cstdint>
#include <fstream>
#include <functional>
#include <string>
#include <variant>
#include <vector>

namespace tracing
{
struct None
{
};
struct Hidden
{
};
struct Text
{
    std::string here;
    std::uint32_t length;  // of the whole
    bool isBytes;
};
struct Address
{
    std::uint64_t number;
};
using Field = std::variant<None, Hidden, Text, Address, int, unsigned, long long, unsigned long long, double>;

struct Record
{
    trace::RecordHead head;
    std::vector<Field> fields;
};

class TraceFile
{
public:
    // Throws tools::Trouble if there is no trace in the file.
    explicit TraceFile(std::string name);

    trace::FileHead const& Head() const { return m_head; }

    // The next record that is complete; false if there is none yet. Throws tools::Trouble for what no trace
    // has.
    bool Next(Record& record);

    // What a program that has died left in its ring, behind the records of the file; nothing while it runs.
    std::vector<Record> Rest() const;

private:
    std::string const m_name;
    std::ifstream m_file;
    trace::FileHead m_head{};
    std::string m_pending;  // of a record that is not complete
};

// All records of a file and of its ring.
void ForEach(std::string const& file, std::function<void(Record const&)> const& take);

// A call: its beginning, its details and its end.
struct TracedCall
{
    Record began;
    std::vector<Record> details;
    std::vector<Field> results;
    std::uint64_t duration = 0;  // ns
    bool hasEnded = false;
    bool isGood = true;  // by the result
};

// In the order of their ends; those without an end come last. dropped: told of losses where they are.
class CallReader
{
public:
    using Take = std::function<void(TracedCall const&)>;

    explicit CallReader(Take take) : m_take(std::move(take)) {}
    void Add(Record const& record);
    void Finish();  // hands out the calls without an end

    unsigned long long Dropped() const { return m_dropped; }

private:
    Take m_take;
    std::vector<TracedCall> m_open;
    unsigned long long m_dropped = 0;
};

trace::CallText const& TextOf(trace::Call call);
std::vector<std::string> NamesIn(char const* list);  // separated by commas
}  // namespace tracing
