// The items of a ticket stream as bytes: what writer and reader must agree on, said once. The writing
// functions put an item at `to`, where MaxItemHeader bytes are free, and return where it ends.
#pragma once

#include "comgui/foundation/number_bits.h"
#include <cstdint>
#include <cstring>
#include <string_view>
#include <type_traits>

namespace comgui::detail
{
enum ITEM_CLASS : unsigned char
{
    ITEM_FULL_KEY = 0x00,
    ITEM_COMPRESSED_KEY = 0x20,
    ITEM_NUMBER = 0x40,
    ITEM_STRING = 0x60,
    ITEM_BINARY = 0x80,
    ITEM_POSITION = 0xA0,
    ITEM_DELETE = 0xC0,
    ITEM_UNUSED = 0xE0,
};

inline constexpr unsigned char ItemClassBits = 0xE0;
inline constexpr unsigned char MediumForm = 0x10;  // the size has 11 bits, in the tag and one more byte
inline constexpr unsigned char LongForm = 0x18;    // the size has 27 bits, in the tag and three more bytes
inline constexpr unsigned long ShortSizes = 1ul << 4;
inline constexpr unsigned long MediumSizes = 1ul << 11;
inline constexpr unsigned long LongSizes = 1ul << 27;

// The size of a number's item says what follows.
enum NUMBER_FORM : unsigned char
{
    NUMBER_ZERO = 0,
    NUMBER_INT8 = 1,
    NUMBER_INT16 = 2,
    NUMBER_INT32 = 4,
    NUMBER_SINGLE = 5,
    NUMBER_DOUBLE = 8,
    NUMBER_INT64 = 9,
};

inline constexpr char SingleMarker = 'i';
inline constexpr char SignedMarker = 'd';
inline constexpr char UnsignedMarker = 'u';

inline constexpr std::string_view TicketSignature = "STICKET_1";

inline constexpr int PositionBias = 2;  // -2 is stored as 0

// Numbers of shared bytes up to here take one byte, two, four; the upper bits of the first tell which.
inline constexpr unsigned long ByteShares = 1ul << 7;
inline constexpr unsigned long ShortShares = 1ul << 14;
inline constexpr unsigned long LongShares = 1ul << 30;
inline constexpr unsigned char LongShareBit = 0x40;

inline constexpr unsigned long MaxItemHeader = 16;

template <typename T>
T BigEndian(T value)
{
    static_assert(std::is_unsigned_v<T>);
    if constexpr (sizeof(T) == 2)
        return __builtin_bswap16(value);
    else if constexpr (sizeof(T) == 4)
        return __builtin_bswap32(value);
    else
        return __builtin_bswap64(value);
}

template <typename T>
char* PutBytes(char* to, T value)
{
    T const bytes = BigEndian(value);
    std::memcpy(to, &bytes, sizeof bytes);
    return to + sizeof bytes;
}

template <typename T>
T GetBytes(unsigned char const* from)
{
    T bytes;
    std::memcpy(&bytes, from, sizeof bytes);
    return BigEndian(bytes);
}

inline char* PutByte(char* to, unsigned int value)
{
    *to = static_cast<char>(value);
    return to + 1;
}

inline char* PutItemTag(char* to, unsigned char itemClass, unsigned long size)
{
    auto const bits = static_cast<std::uint32_t>(size);
    if (size < ShortSizes)
        return PutByte(to, itemClass | bits);
    if (size < MediumSizes)
        return PutBytes(
            to, static_cast<std::uint16_t>(static_cast<std::uint32_t>(itemClass | MediumForm) << 8 | bits));
    if (size < LongSizes)
        return PutBytes(to, static_cast<std::uint32_t>(itemClass | LongForm) << 24 | bits);
    throw "Tag size overflow";
}

// All but the tail of a key that shares its first bytes with the previous one.
inline char* PutKeyHeader(char* to, unsigned long shared, unsigned long tailSize)
{
    if (shared < ByteShares)
        return PutByte(PutItemTag(to, ITEM_COMPRESSED_KEY, tailSize + 1), static_cast<unsigned int>(shared));
    if (shared < ShortShares)
        return PutBytes(PutItemTag(to, ITEM_COMPRESSED_KEY, tailSize + 2),
                        static_cast<std::uint16_t>(shared | 0x8000));
    if (shared < LongShares)
        return PutBytes(PutItemTag(to, ITEM_COMPRESSED_KEY, tailSize + 4),
                        static_cast<std::uint32_t>(shared | 0xC0000000));
    throw "Key same overflow";
}

// Where the value behind one at pos is expected: one further, but a negative position stays.
inline int NextPosition(int pos)
{
    // Unsigned, as a stream of 2^31 values would overflow.
    return pos < 0 ? pos : static_cast<int>(static_cast<unsigned int>(pos) + 1);
}

// A position below -2 wraps to a size that no tag can hold.
inline char* PutPosition(char* to, int pos)
{
    return PutItemTag(to, ITEM_POSITION, static_cast<std::uint32_t>(pos) + PositionBias);
}

inline char* PutNumberTag(char* to, NUMBER_FORM form) { return PutItemTag(to, ITEM_NUMBER, form); }

// A set of forms, a bit for each.
using NUMBER_FORMS = unsigned;
constexpr NUMBER_FORMS FormBit(NUMBER_FORM form) { return 1u << form; }

struct INTEGER_FORM
{
    unsigned char size;
    unsigned char shift;  // to the upper end of a word
};

// By the place of the highest bit that matters, the sign included, in eights.
inline constexpr INTEGER_FORM IntegerForms[] = {{NUMBER_INT8, 24},
                                                {NUMBER_INT16, 16},
                                                {NUMBER_INT32, 0},
                                                {NUMBER_INT32, 0}};

// The shortest form, found without a branch but for 0: in a vector of mixed sizes none could be foreseen.
inline char* PutInteger(char* to, int value)
{
    if (value == 0)
        return PutNumberTag(to, NUMBER_ZERO);
    auto const bits = static_cast<std::uint32_t>(value);
    std::uint32_t const matter = (value < 0 ? ~bits : bits) << 1 | 1;
    INTEGER_FORM const form = IntegerForms[(31u ^ static_cast<unsigned int>(std::countl_zero(matter))) / 8];
    to = PutByte(to, ITEM_NUMBER | unsigned{form.size});
    // What stands behind the bytes that count is overwritten by the next item.
    PutBytes(to, bits << form.shift);
    return to + form.size;
}

inline char* PutSingle(char* to, float value)
{
    to = PutByte(PutNumberTag(to, NUMBER_SINGLE), SingleMarker);
    return PutBytes(to, std::bit_cast<std::uint32_t>(value));
}

inline char* PutDouble(char* to, double value)
{
    return PutBytes(PutNumberTag(to, NUMBER_DOUBLE), std::bit_cast<std::uint64_t>(value));
}

// The shortest form from which the number can be had back. -0.0 becomes the integer 0, and an infinity NaN.
inline char* PutOptimizedDouble(char* to, double value)
{
    if (value >= -0x1p31 && value < 0x1p31)  // no NaN
    {
        int const integer = static_cast<int>(value);
        if (integer == value)
            return PutInteger(to, integer);
    }
    else if (IsNotANumber(value))
        return PutDouble(to, NotADoubleNumber);
    if (static_cast<float>(value) == value)
        return PutSingle(to, static_cast<float>(value));
    return PutDouble(to, value);
}

inline char* PutPoly64(char* to, unsigned long long value, char marker)
{
    to = PutByte(PutNumberTag(to, NUMBER_INT64), static_cast<unsigned char>(marker));
    return PutBytes(to, static_cast<std::uint64_t>(value));
}

inline char* PutInt64(char* to, long long value)
{
    if (FitsIntoDouble(value))
        return PutOptimizedDouble(to, static_cast<double>(value));
    return PutPoly64(to, static_cast<unsigned long long>(value), SignedMarker);
}

inline char* PutUnsigned64(char* to, unsigned long long value)
{
    if (FitsIntoDouble(value))
        return PutOptimizedDouble(to, U64ToDouble(value));
    return PutPoly64(to, value, FitsIntoLongLong(value) ? SignedMarker : UnsignedMarker);
}
}  // namespace comgui::detail
