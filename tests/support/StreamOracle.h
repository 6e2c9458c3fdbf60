// A second, slow writer and reader of ticket streams to hold the library's against: byte after byte into
// vectors, with nothing of the library's code but the numbers of PARAM_TYPE and the layout of a record.
#pragma once

#include "comgui/ticket/PARAM_TYPE.h"
#include "comgui/ticket/SETMULTIPAR.h"
#include <iosfwd>
#include <optional>
#include <string>
#include <vector>

namespace StreamOracle
{
// One parameter with its value beside it.
struct RECORD
{
    std::string key;
    PARAM_TYPE type = PARAM_NONE;
    int pos = -1;
    bool isNull = false;            // the value word is null
    unsigned long long number = 0;  // of a number: an integer in 64 bits, a double as it lies in memory
    std::string bytes;              // of a text or of bytes

    friend bool operator==(RECORD const&, RECORD const&) = default;
};

void PrintTo(RECORD const& record, std::ostream* out);

RECORD Int(std::string key, int value, int pos = -1);
RECORD Double(std::string key, double value, int pos = -1);
RECORD Text(std::string key, std::string value, int pos = -1);
RECORD Bytes(std::string key, std::string value, int pos = -1);
RECORD Int64(std::string key, long long value, int pos = -1);
RECORD Unsigned(std::string key, unsigned int value, int pos = -1);
RECORD Unsigned64(std::string key, unsigned long long value, int pos = -1);
RECORD Delete(std::string key, int pos = -1);

// The records of a library's table, terminator left out; nothing for null.
std::vector<RECORD> RecordsOf(SETMULTIPAR const* table);

// Whether every record has a key of its own, or equal ones in a row stand at one address, as in the table of
// a list: a writer may tell them by their addresses then.
enum class KEYS
{
    APART,
    SHARED,
};

// A library's table of such records, whose addresses live as long as the object.
class TABLE
{
public:
    explicit TABLE(std::vector<RECORD> records, KEYS keys = KEYS::APART);
    TABLE(TABLE const&) = delete;
    TABLE& operator=(TABLE const&) = delete;

    SETMULTIPAR* Records() { return m_table.data(); }

private:
    struct VALUE
    {
        int asInt;
        unsigned int asUnsigned;
        double asDouble;
        long long asInt64;
        unsigned long long asUnsigned64;
        struct
        {
            void const* data;
            unsigned long size;
        } asBytes;
    };
    std::vector<RECORD> const m_records;  // own the texts and bytes
    std::vector<VALUE> m_values;
    std::vector<SETMULTIPAR> m_table;
};

// Whether a stream can hold the record.
bool IsWritable(RECORD const& record);

// The stream of the records; none where there is no such stream, as with a position below -2.
std::optional<std::string> Encode(std::vector<RECORD> const& records);

// What a reader makes of the bytes: whether it takes all of them, and the records up to there.
struct READING
{
    bool isGood = false;
    std::vector<RECORD> records;
};
READING Decode(std::string const& stream, bool fixPositions);

// What comes back of the records once they were written and read: told from the records alone, without a
// look at any bytes.
std::vector<RECORD> ReadBack(std::vector<RECORD> const& records, bool fixPositions);
}  // namespace StreamOracle
