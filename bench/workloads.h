// The records that the benchmarks write, read and build: three tickets, the same in every run.
#pragma once

#include <comgui/comgui.h>

#include <cstddef>
#include <deque>
#include <string>
#include <string_view>
#include <vector>

// The records of one ticket with all that they point at, in the order in which a walk delivers them: by key,
// then by position. As in a table of SETMULTIPAR_LIST the records of one key share its address.
class WORKLOAD
{
public:
    WORKLOAD();
    WORKLOAD(WORKLOAD&&) = default;
    WORKLOAD& operator=(WORKLOAD&&) = default;

    // Not const, since to write a table is to change its ok bytes.
    SETMULTIPAR* Table() { return table.data(); }
    std::size_t Size() const { return table.size() - 1; }

    // An address for key, for one or more calls of Add.
    char const* Key(std::string key);

    // pos: -1 for a single value, 0 and up in a vector.
    void Add(char const* key, int value, int pos = -1);
    void Add(char const* key, unsigned int value, int pos = -1);
    void Add(char const* key, long long value, int pos = -1);
    void Add(char const* key, double value, int pos = -1);
    void AddText(char const* key, std::string text);
    void AddBytes(char const* key, std::string bytes);

private:
    void AddRecord(char const* key, PARAM_TYPE type, void const* value, int pos);

    std::vector<SETMULTIPAR> table;  // always with its terminator
    std::deque<std::string> texts;
    std::deque<int> ints;
    std::deque<unsigned int> unsigneds;
    std::deque<long long> int64s;
    std::deque<double> doubles;
    std::deque<BIN_STRING> views;
};

// Each is made at its first use and lives until the end of the program.
WORKLOAD& JobTicket();     // 400 keys of all types, some of them vectors of 3 to 16 values
WORKLOAD& BigVector();     // a vector of 100,000 doubles and one of 100,000 16-bit numbers
WORKLOAD& SystemTicket();  // 3,000 keys with long common beginnings, four fifths of them texts

// The first record behind those of first's key.
inline SETMULTIPAR const* EndOfKey(SETMULTIPAR const* first)
{
    SETMULTIPAR const* end = first + 1;
    while (end->key == first->key)
        ++end;
    return end;
}

inline bool IsVector(SETMULTIPAR const& first) { return first.pos >= 0; }

// The end of each key in turn, for formats that must tell how many keys and values follow: one look at the
// table for both. ends is to be kept, for its memory.
inline void FindEnds(SETMULTIPAR const* table, std::vector<SETMULTIPAR const*>& ends)
{
    ends.clear();
    while (table->key)
        ends.push_back(table = EndOfKey(table));
}

// The value of a record that is known to be of that type.
template <typename T>
T const& ValueOf(SETMULTIPAR const& record)
{
    return *static_cast<T const*>(record.value);
}

inline std::string_view TextOf(SETMULTIPAR const& record) { return static_cast<char const*>(record.value); }

inline std::string_view BytesOf(SETMULTIPAR const& record)
{
    BIN_STRING const& view = ValueOf<BIN_STRING>(record);
    return {static_cast<char const*>(view.data), view.size};
}

// Holds values that were read back against the records that had been written, in their order.
class COMPARISON
{
public:
    explicit COMPARISON(SETMULTIPAR const* table) : next(table) {}

    // The record that the next call is held against, for formats that cannot tell its type.
    SETMULTIPAR const& Expected() const { return *next; }

    // Numbers are compared by value: none of the formats keeps all types of numbers apart. A long double
    // holds every one of them exactly.
    void Number(std::string_view key, int pos, long double value);
    void Text(std::string_view key, int pos, std::string_view text);
    void Bytes(std::string_view key, int pos, std::string_view bytes);

    // True if every record came, in order, with its key, position and value, and nothing else did.
    bool Equal() const { return equal && !next->key; }

private:
    void Take(std::string_view key, int pos, bool sameValue);

    SETMULTIPAR const* next;
    bool equal = true;
};
