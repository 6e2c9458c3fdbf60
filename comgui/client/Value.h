// Values of tickets, each as what it is. Plain values with no ties to a server.
//
// The alternatives of Value lie in the order of PARAM_TYPE, so that a value's index is its type on the wire.
#pragma once

#include "comgui/client/Result.h"
#include "comgui/ticket/PARAM_TYPE.h"
#include <string>
#include <string_view>
#include <type_traits>
#include <variant>
#include <vector>

namespace comgui
{
// An address that means something only in the process it comes from.
struct Pointer
{
    void* address = nullptr;
};

// Bytes of any kind, zeros included.
struct Bytes
{
    std::string bytes;
};

struct Element;

// Several values under one key, by ascending position. A position without an element is a gap.
using List = std::vector<Element>;

// std::monostate: no value.
class COMGUI_EXPORT Value : public std::variant<std::monostate, Pointer, int, double, std::string, Bytes,
                                                List, long long, unsigned int, unsigned long long>
{
public:
    using variant::variant;
    Value(std::string_view text);
    Value(long number) noexcept;
    Value(unsigned long number) noexcept;

    PARAM_TYPE Type() const noexcept { return static_cast<PARAM_TYPE>(index()); }  // PARAM_COUNT: a list
    bool IsNone() const noexcept { return Type() == PARAM_NONE; }
    bool IsList() const noexcept { return Type() == PARAM_COUNT; }
};

struct Element
{
    int pos;
    Value value;
};

// Here, where a list's elements are complete.
inline Value::Value(std::string_view text) : variant(std::string(text)) {}
inline Value::Value(long number) noexcept : variant(static_cast<long long>(number)) {}
inline Value::Value(unsigned long number) noexcept : variant(static_cast<unsigned long long>(number)) {}

COMGUI_EXPORT bool operator==(Pointer left, Pointer right);
COMGUI_EXPORT bool operator==(Bytes const& left, Bytes const& right);
COMGUI_EXPORT bool operator==(Element const& left, Element const& right);

// Equal values of one type; a double that is no number equals itself, so that a snapshot equals its copy.
COMGUI_EXPORT bool operator==(Value const& left, Value const& right);
inline bool operator!=(Value const& left, Value const& right) { return !(left == right); }

// "int", "double", "text", "bytes", "int64", "unsigned", "unsigned64", "pointer", "list", "none".
// Always English; wxGetTranslation(NameOf(type), "comgui") is in the user's language.
COMGUI_EXPORT char const* NameOf(PARAM_TYPE type);

namespace detail
{
template <typename T, typename... Types>
constexpr bool IsOneOf = (std::is_same_v<T, Types> || ...);

template <typename T>
constexpr bool IsOneValue = IsOneOf<T, int, double, std::string, Bytes, Pointer, long, unsigned long,
                                    long long, unsigned int, unsigned long long>;

template <typename T>
struct READABLE
{
    static constexpr bool IsIt = IsOneValue<T>;
};
template <typename T>
struct READABLE<std::vector<T>>
{
    static constexpr bool IsIt = IsOneValue<T>;
};

// T, if values can be read as that.
template <typename T>
struct READ_TYPE
{
    static_assert(READABLE<T>::IsIt, "As and ReadAs give the types that the comment of As names, no others");
    using Type = T;
};
template <typename T>
using Readable = typename READ_TYPE<T>::Type;
}  // namespace detail

// The values at positions 0, 1, 2 ... T: any that As gives, but a vector.
template <typename T>
List MakeList(std::vector<T> const& values)
{
    static_assert(detail::IsOneValue<T>, "a list holds values of the types that As gives, but a vector");
    List list;
    for (T const& value : values)
        list.push_back({static_cast<int>(list.size()), Value(value)});
    return list;
}

// As text, UTF-8, that FromText reads back without loss, given the value or its type. Numbers in the C
// locale, doubles in the shortest form; bytes as hexadecimal digits in pairs; a list with ", " between its
// values, texts with a comma, a quote, spaces at an end or a bracket at the beginning in quotes, and nothing
// for a gap; behind a gap of more than 16 positions "[123] " before the value, its position; no value is the
// empty text.
COMGUI_EXPORT std::string ToText(Value const& value);

// The value of that type that a user has typed. For PARAM_COUNT the elements get the type elementType; the
// empty text is the list without elements. Errors: NotANumber, OutOfRange, BadList, WrongType.
COMGUI_EXPORT Result<Value> FromText(std::string_view text, PARAM_TYPE type,
                                     PARAM_TYPE elementType = PARAM_STRING);

// What a user has made of before's text. Each position of a list gets the type of its value before, a new one
// that of the value in front of it; so a mixed list keeps its types, which its text does not show. A pointer
// is read back from its own text only: it is WrongType to change one.
COMGUI_EXPORT Result<Value> FromText(std::string_view text, Value const& before);

// The value as a T: int, double, std::string, Bytes, Pointer, long and long long (so std::int64_t), unsigned
// int, unsigned long and unsigned long long, or a std::vector of one of them. Numbers change their type if
// that loses nothing; a std::string is ToText of any value; a list without gaps becomes a vector, a single
// value a vector of one, no value none. Errors: WrongType, OutOfRange.
template <typename T>
Result<detail::Readable<T>> As(Value const& value);
}  // namespace comgui
