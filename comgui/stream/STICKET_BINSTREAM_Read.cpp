#include "comgui/foundation/utf8func.h"
#include "comgui/stream/STICKET_BINSTREAM.h"
#include "comgui/stream/ticket_items.h"
#include "comgui/ticket/LIST_CONTENTS.h"
#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include <algorithm>
#include <array>
#include <memory>
#include <new>
#include <utility>

using namespace comgui::detail;

inline unsigned char const* STICKET_BINSTREAM::IMPORT_INTERN::BYTES::Take(unsigned long size)
{
    if (size > left)
        throw "Unexpected EOF";
    left -= size;
    unsigned char const* const taken = address;
    address += size;
    return taken;
}

STICKET_BINSTREAM::IMPORT_INTERN::IMPORT_INTERN(void const* data, unsigned long size)
    : bytes{static_cast<unsigned char const*>(data), size}
{
}

unsigned char STICKET_BINSTREAM::IMPORT_INTERN::GetByte() { return *bytes.Take(1); }

void STICKET_BINSTREAM::IMPORT_INTERN::GetShort(short& value)
{
    value = static_cast<short>(GetBytes<std::uint16_t>(bytes.Take(2)));
}

void STICKET_BINSTREAM::IMPORT_INTERN::GetInt(int& value)
{
    value = static_cast<int>(GetBytes<std::uint32_t>(bytes.Take(4)));
}

void STICKET_BINSTREAM::IMPORT_INTERN::GetFloat(double& value)
{
    // The marker in front is not looked at: any byte is good.
    float const single = std::bit_cast<float>(GetBytes<std::uint32_t>(bytes.Take(5) + 1));
    value = IsNotANumber(single) ? NotADoubleNumber : static_cast<double>(single);
}

void STICKET_BINSTREAM::IMPORT_INTERN::GetDouble(double& value)
{
    value = CastToNotANumber(std::bit_cast<double>(GetBytes<std::uint64_t>(bytes.Take(8))));
}

void STICKET_BINSTREAM::IMPORT_INTERN::GetPoly64(PARAM_TYPE& type, unsigned long long& value)
{
    unsigned char const* const item = bytes.Take(9);
    type = *item == SignedMarker ? PARAM_INT64 : *item == UnsignedMarker ? PARAM_UNSIGNED64 : PARAM_NONE;
    if (type == PARAM_NONE)
        throw "Unexpected POLY64_";
    value = GetBytes<std::uint64_t>(item + 1);
}

unsigned char STICKET_BINSTREAM::IMPORT_INTERN::GetTag(unsigned long& size) { return TakeTag(size); }

inline unsigned char STICKET_BINSTREAM::IMPORT_INTERN::TakeTag(unsigned long& size)
{
    unsigned char const tag = *bytes.Take(1);
    if ((tag & MediumForm) == 0)
        size = tag & (ShortSizes - 1);
    else if ((tag & LongForm) == MediumForm)
        size = (tag & 7ul) << 8 | *bytes.Take(1);
    else
    {
        unsigned char const* const rest = bytes.Take(3);
        size =
            (tag & 7ul) << 24 | static_cast<unsigned long>(rest[0]) << 16 | GetBytes<std::uint16_t>(rest + 1);
    }
    return tag & ItemClassBits;
}

// The tag of a number, if the next item is one of these forms and all of it is there.
inline bool STICKET_BINSTREAM::IMPORT_INTERN::TakeNumberTag(NUMBER_FORMS forms, unsigned long& size)
{
    if (bytes.left == 0)
        return false;
    unsigned const form = *bytes.address ^ ITEM_NUMBER;
    if (form >= ShortSizes || (forms >> form & 1) == 0 || bytes.left <= form)
        return false;
    bytes.Take(1);
    size = form;
    return true;
}

// size: of one of the integers' forms.
inline int STICKET_BINSTREAM::IMPORT_INTERN::TakeInteger(unsigned long size)
{
    if (bytes.left < sizeof(std::uint32_t))
    {
        int value = 0;
        unsigned char const* const from = bytes.Take(size);
        for (unsigned long i = 0; i < size; ++i)
            value = i == 0 ? static_cast<signed char>(from[i]) : value * 256 + from[i];
        return value;
    }
    // Whichever form it is, nothing has to be foreseen.
    std::uint64_t const word = GetBytes<std::uint32_t>(bytes.Take(size));
    auto const value = static_cast<std::int64_t>(word << 32) >> (64 - 8 * size) % 64;
    return size == 0 ? 0 : static_cast<int>(value);
}

// size: of one of the doubles' forms.
inline double STICKET_BINSTREAM::IMPORT_INTERN::TakeDouble(unsigned long size)
{
    double value;
    size == NUMBER_SINGLE ? GetFloat(value) : GetDouble(value);
    return value;
}

void STICKET_BINSTREAM::IMPORT_INTERN::GetString(std::string& value, unsigned long size)
{
    unsigned char const* const text = bytes.Take(size);  // before the copy: a false size must not allocate
    value.assign(reinterpret_cast<char const*>(text), size);
}

void STICKET_BINSTREAM::IMPORT_INTERN::GetKeyOpt(std::string& key, unsigned long size, bool compressed)
{
    key = TakeKey(size, compressed);
}

// The key is put together in place, behind what it shares with the previous one.
std::string_view STICKET_BINSTREAM::IMPORT_INTERN::TakeKey(unsigned long size, bool compressed)
{
    BYTES item{bytes.Take(size), size};
    // A key may claim to share more than there is: it shares all.
    unsigned long const shared = compressed ? std::min(TakeShared(item), previousSize) : 0;
    previousSize = shared + item.left;
    if (previousSize > previousKey.size())
        previousKey.resize(std::max(previousSize, 2 * previousKey.size()));
    std::string_view const tail(reinterpret_cast<char const*>(item.address), item.left);
    Copy(previousKey.data() + shared, tail.data(), tail.size());
    previousText = previousText < shared ? previousText : shared + SizeToZero(tail.data(), tail.size());
    return {previousKey.data(), previousSize};
}

// How many bytes a compressed key shares with the previous one; the item is that key's alone.
unsigned long STICKET_BINSTREAM::IMPORT_INTERN::TakeShared(BYTES& item)
{
    if (item.left == 0)
        throw "Unexpected EOT 1";
    unsigned long const first = *item.Take(1);
    if (first < ByteShares)
        return first;
    if (item.left == 0)
        throw "Unexpected EOT 2";
    unsigned long const second = *item.Take(1);
    if ((first & LongShareBit) == 0)
        return (first & 0x7F) << 8 | second;
    if (item.left < 2)
        throw "Unexpected EOT 4";
    return (first & 0x3F) << 24 | second << 16 | GetBytes<std::uint16_t>(item.Take(2));
}

// One reading of a stream into a list, or without one just to see whether it can be read.
class STICKET_BINSTREAM::RECORDS
{
public:
    RECORDS(LIST_CONTENTS* list, void const* data, unsigned long size, bool fixPositions)
        : m_list(list), m_cursor(data, size), m_fixPositions(fixPositions)
    {
    }

    // Goes through all records of the stream, or throws at its first error. There is at least one byte.
    void TakeAll()
    {
        TakeSignature();
        while (m_cursor.HasData())
            TakeItem();
    }

private:
    void TakeSignature()
    {
        unsigned long size;
        if (m_cursor.TakeTag(size) != ITEM_FULL_KEY)
            throw "Signature not found";
        if (TakeKey(size, false) != TicketSignature)
            throw "Wrong signature";
    }

    // Part of the loop over the items, with the rarer and longer ones out of its way.
    [[gnu::always_inline]] void TakeItem()
    {
        unsigned long size;
        switch (m_cursor.TakeTag(size))
        {
        case ITEM_FULL_KEY:
            TakeKey(size, false);
            return;
        case ITEM_COMPRESSED_KEY:
            TakeKey(size, true);
            return;
        case ITEM_NUMBER:
            return TakeNumber(size);
        case ITEM_STRING:
            return AddText(m_cursor.bytes.Take(size), size);
        case ITEM_BINARY:
            return AddBinary(m_cursor.bytes.Take(size), size);
        case ITEM_POSITION:
            m_pos = static_cast<int>(size) - PositionBias;
            return;
        case ITEM_DELETE:
            m_fixNext = false;  // a delete stands where it says, also behind a key
            return Add(PARAM_NONE, [] { return nullptr; });
        default:
            throw "Invalid tag";
        }
    }

    std::string_view TakeKey(unsigned long size, bool compressed)
    {
        m_cachedKey = nullptr;
        m_fixNext |= m_fixPositions;
        return m_cursor.TakeKey(size, compressed);
    }

    void TakeNumber(unsigned long size)
    {
        switch (size)
        {
        case NUMBER_ZERO:
        case NUMBER_INT8:
        case NUMBER_INT16:
        case NUMBER_INT32:
            return TakeIntegers(size);
        case NUMBER_SINGLE:
        case NUMBER_DOUBLE:
            return TakeDoubles(size);
        case NUMBER_INT64:
            return AddInteger64();
        default:
            throw "Invalid number size";
        }
    }

    [[gnu::noinline]] void AddText(unsigned char const* text, unsigned long size)
    {
        std::string_view const bytes(reinterpret_cast<char const*>(text), size);
        Add(PARAM_STRING,
            [&] { return m_list->texts.Keep(bytes.substr(0, SizeToZero(bytes.data(), bytes.size()))).text; });
    }

    [[gnu::noinline]] void AddBinary(unsigned char const* bytes, unsigned long size)
    {
        Add(PARAM_BINSTRING,
            [&] { return &m_list->binaries.Keep(BINARY::Of(BIN_STRING(bytes, size))).view; });
    }

    // The numbers of a vector stand one behind the other. Where the list keeps a number is a matter of its
    // hash; so the places of many are asked for before the first is looked at, and come together.
    void TakeIntegers(unsigned long size)
    {
        std::array<int, Together> values;
        std::size_t count = 0;
        do
            values[count++] = m_cursor.TakeInteger(size);
        while (count < Together && m_cursor.TakeNumberTag(Integers, size));
        if (count > 1 && m_list)
            std::for_each_n(values.begin(), count, [&](int value) { m_list->ints.Expect(value); });
        std::for_each_n(values.begin(), count,
                        [&](int& value) { Add(PARAM_INT, [&] { return &m_list->ints.Keep(value); }); });
    }

    void TakeDoubles(unsigned long size)
    {
        std::array<double, Together> values;
        std::size_t count = 0;
        do
            values[count++] = m_cursor.TakeDouble(size);
        while (count < Together && m_cursor.TakeNumberTag(Doubles, size));
        if (count > 1 && m_list)
            std::for_each_n(values.begin(), count, [&](double value) { m_list->doubles.Expect(value); });
        std::for_each_n(values.begin(), count,
                        [&](double& value) { Add(PARAM_DOUBLE, [&] { return m_list->Kept(value); }); });
    }

    [[gnu::noinline]] void AddInteger64()
    {
        PARAM_TYPE type;
        unsigned long long value;
        m_cursor.GetPoly64(type, value);
        Add(type, [&] { return m_list->Kept(type, &value); });
    }

    // cached: puts the value into a cache of the list and gives its address there.
    template <typename CACHED>
    void Add(PARAM_TYPE type, CACHED cached)
    {
        if (m_list == nullptr)
            return;
        // The key last: its bytes were put together just now, and to load them at once would stall.
        void const* const value = cached();
        if (m_cachedKey == nullptr)
            m_cachedKey = m_list->keys.Keep(m_cursor.Key());
        m_list->Add(m_cachedKey, type, value, FixPos(m_fixNext, m_pos));
    }

    static constexpr NUMBER_FORMS Integers =
        FormBit(NUMBER_ZERO) | FormBit(NUMBER_INT8) | FormBit(NUMBER_INT16) | FormBit(NUMBER_INT32);
    static constexpr NUMBER_FORMS Doubles = FormBit(NUMBER_SINGLE) | FormBit(NUMBER_DOUBLE);
    static constexpr std::size_t Together = 64;

    LIST_CONTENTS* const m_list;
    IMPORT_INTERN m_cursor;
    bool const m_fixPositions;
    bool m_fixNext = false;  // the next value is the first behind a key whose position is to be fixed
    int m_pos = -1;
    char const* m_cachedKey = nullptr;  // the list's copy of the current key, once it was needed
};

bool STICKET_BINSTREAM::ReadAll(SETMULTIPAR_LIST* list, void const* data, unsigned long size,
                                bool fixPositions)
{
    if (size == 0)
        return true;
    try
    {
        RECORDS(list ? &list->Contents() : nullptr, data, size, fixPositions).TakeAll();
        return true;
    }
    catch (...)  // a broken stream, or no memory: what was read stays in the list
    {
        return false;
    }
}

bool STICKET_BINSTREAM::Read(SETMULTIPAR_LIST& list, void const* data, unsigned long size, bool fixPositions)
{
    return ReadAll(&list, data, size, fixPositions);
}

bool STICKET_BINSTREAM::Check(void const* data, unsigned long size)
{
    return ReadAll(nullptr, data, size, false);
}

bool STICKET_BINSTREAM::Read(STICKET_ACCESS const* ticket, void const* data, unsigned long size,
                             bool fixPositions)
{
    if (ticket == nullptr || ticket->SSETMULTIPAR == nullptr)
        return false;
    if (size == 0)
        return true;
    SETMULTIPAR_LIST list(false);
    SETMULTIPAR* table;
    try
    {
        if (!Read(list, data, size, fixPositions))
            return false;
        table = list.Table(false);
    }
    catch (std::bad_alloc const&)
    {
        return false;
    }
    return ticket->SSETMULTIPAR(ticket->Instance, table) != 0;
}

bool STICKET_BINSTREAM::Read(STICKET_ACCESS const* ticket, char const* filename)
{
    FILE* const file = utf8func::fopen(filename, "rb");
    if (file == nullptr)
        return false;
    unsigned long const size = fsize(file);
    std::unique_ptr<char[]> const bytes(size != 0 ? new (std::nothrow) char[size] : nullptr);
    if (bytes && std::fread(bytes.get(), 1, size, file) == size)
        Read(ticket, bytes.get(), size, true);
    std::fclose(file);
    return true;  // whatever was in it: a caller learns only whether there is such a file
}

int STICKET_BINSTREAM::FixPos(bool& fixNext, int& pos)
{
    int const here = pos;
    pos = NextPosition(pos);
    bool const isFixed = std::exchange(fixNext, false) && (here == 0 || here == -2);
    return isFixed ? -1 : here;
}

unsigned long STICKET_BINSTREAM::fsize(FILE* file)
{
    long const size = std::fseek(file, 0, SEEK_END) == 0 ? std::ftell(file) : -1;
    std::rewind(file);
    return size > 0 ? static_cast<unsigned long>(size) : 0;
}
