#include "comgui/client/Value.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <iterator>
#include <limits>
#include <optional>
#include <type_traits>
#include <wx/translation.h>

namespace comgui
{
namespace
{
template <typename T>
constexpr bool IsNumber =
    detail::IsOneOf<T, int, double, long, unsigned long, long long, unsigned int, unsigned long long>;

template <typename T>
std::string NumberText(T number)
{
    char digits[32];
    return {digits, std::to_chars(digits, std::end(digits), number).ptr};
}

std::string HexText(std::string_view bytes)
{
    constexpr char Digits[] = "0123456789abcdef";
    std::string text;
    for (char const c : bytes)
    {
        auto const byte = static_cast<unsigned char>(c);
        text += {Digits[byte >> 4], Digits[byte & 15]};
    }
    return text;
}

// Gaps are shown by their commas. One that is longer is shown by the position of the value behind it, as one
// comma for each of 16,777,215 positions would make a giant text.
constexpr int LongestGap = 16;

bool NeedsQuotes(std::string_view text)
{
    return text.empty() || text.front() == '[' || text.find_first_of(",\"") != text.npos ||
           text.front() == ' ' || text.back() == ' ';
}

std::string Quoted(std::string_view text)
{
    std::string quoted = "\"";
    for (char const c : text)
        quoted += c == '"' ? std::string("\"\"") : std::string(1, c);
    return quoted + '"';
}

std::string ListText(List const& list)
{
    std::string all;
    long long next = 0;
    for (Element const& element : list)
    {
        bool const isFar = element.pos - next > LongestGap;
        for (; !isFar && next < element.pos; ++next)
            all += next == 0 ? "" : ", ";  // a gap
        all += all.empty() && (isFar || next == 0) ? "" : ", ";
        if (isFar)
            all += '[' + std::to_string(element.pos) + "] ";
        next = element.pos + 1LL;
        std::string const text = ToText(element.value);
        bool const isText = element.value.Type() == PARAM_STRING;
        all += text.empty() || (isText && NeedsQuotes(text)) ? Quoted(text) : text;
    }
    return all;
}

std::string_view Trimmed(std::string_view text)
{
    auto const begin = text.find_first_not_of(' ');
    return begin == text.npos ? std::string_view()
                              : text.substr(begin, text.find_last_not_of(' ') - begin + 1);
}

Error Failure(ERROR_CODE code, std::string_view about) { return {code, std::string(about), {}}; }

template <typename T>
Result<Value> NumberFrom(std::string_view text)
{
    std::string_view digits = Trimmed(text);
    if (digits.size() > 1 && digits[0] == '+' && digits[1] != '-')
        digits.remove_prefix(1);
    T number{};
    auto const [end, error] = std::from_chars(digits.data(), digits.data() + digits.size(), number);
    if (error == std::errc::result_out_of_range)
        return Failure(OutOfRange, text);
    if (error != std::errc() || end != digits.data() + digits.size())
    {
        // A negative number is one, though not of a type without a sign.
        long long negative = 0;
        bool const isNegative = std::is_unsigned_v<T> && digits.size() > 1 && digits[0] == '-' &&
                                std::from_chars(digits.data(), digits.data() + digits.size(), negative).ptr ==
                                    digits.data() + digits.size();
        return Failure(isNegative ? OutOfRange : NotANumber, text);
    }
    return Value(number);
}

std::optional<unsigned char> DigitOf(char c)
{
    if (c >= '0' && c <= '9')
        return static_cast<unsigned char>(c - '0');
    c = static_cast<char>(c | 0x20);
    if (c >= 'a' && c <= 'f')
        return static_cast<unsigned char>(c - 'a' + 10);
    return std::nullopt;
}

Result<Value> BytesFrom(std::string_view text)
{
    std::string_view const digits = Trimmed(text);
    Bytes bytes;
    for (std::size_t i = 0; i < digits.size(); i += 2)
    {
        auto const high = DigitOf(digits[i]);
        auto const low = i + 1 < digits.size() ? DigitOf(digits[i + 1]) : std::nullopt;
        if (!high || !low)
            return Failure(NotANumber, text);
        bytes.bytes += static_cast<char>(*high << 4 | *low);
    }
    return Value(std::move(bytes));
}

// One field of a list: what stands between two commas, and whether it was in quotes.
struct Field
{
    std::string text;
    bool isQuoted = false;
};

// Takes the field at the beginning of rest, with the comma behind it.
Result<Field> TakeField(std::string_view& rest)
{
    std::string_view const whole = rest;
    while (!rest.empty() && rest[0] == ' ')
        rest.remove_prefix(1);
    Field field;
    if (rest.empty() || rest[0] != '"')
    {
        auto const comma = std::min(rest.find(','), rest.size());
        field.text = Trimmed(rest.substr(0, comma));
        rest.remove_prefix(comma);
        return field.text.find('"') == std::string::npos ? Result<Field>(field) : Failure(BadList, whole);
    }
    field.isQuoted = true;
    for (rest.remove_prefix(1);; rest.remove_prefix(1))
    {
        if (rest.empty())
            return Failure(BadList, whole);
        if (rest[0] == '"')
        {
            rest.remove_prefix(1);
            if (rest.empty() || rest[0] != '"')
                break;
        }
        field.text += rest[0];
    }
    while (!rest.empty() && rest[0] == ' ')
        rest.remove_prefix(1);
    return rest.empty() || rest[0] == ',' ? Result<Field>(field) : Failure(BadList, whole);
}

// Takes "[123]" from the beginning of rest, if a value follows, as the position of that.
// Without it pos is left as it is.
Outcome TakePosition(std::string_view& rest, long long& pos)
{
    auto const begin = std::min(rest.find_first_not_of(' '), rest.size());
    auto const end = rest.find(']', begin);
    if (end == rest.npos || rest[begin] != '[')
        return {};
    std::string_view const digits = rest.substr(begin + 1, end - begin - 1);
    std::string_view const value = Trimmed(rest.substr(end + 1));
    if (digits.empty() || digits.find_first_not_of("0123456789") != digits.npos || value.empty() ||
        value.front() == ',')
        return {};
    int given = 0;
    if (std::from_chars(digits.data(), digits.data() + digits.size(), given).ec != std::errc())
        return Failure(OutOfRange, rest);
    if (given < pos)
        return Failure(BadList, rest);
    pos = given;
    rest.remove_prefix(end + 1);
    return {};
}

// from(text, pos): the value of the field at that position.
template <typename From>
Result<Value> ListFrom(std::string_view text, From from)
{
    List list;
    std::string_view rest = text;
    for (long long pos = 0; !Trimmed(rest).empty() || pos > 0; ++pos)
    {
        if (Outcome const taken = TakePosition(rest, pos); !taken)
            return taken.GetError();
        if (pos > std::numeric_limits<int>::max())
            return Failure(OutOfRange, text);
        Result<Field> const field = TakeField(rest);
        if (!field)
            return field.GetError();
        if (field->isQuoted || !field->text.empty())
        {
            Result<Value> value = from(field->text, static_cast<int>(pos));
            if (!value)
                return value;
            list.push_back({static_cast<int>(pos), *std::move(value)});
        }
        if (rest.empty())
            break;
        rest.remove_prefix(1);  // the comma
    }
    return Value(std::move(list));
}

// The number as a To, if it is one; compared without a conversion that could be undefined.
template <typename To, typename From>
std::optional<To> Exactly(From from)
{
    if constexpr (std::is_same_v<From, double> && std::is_same_v<To, double>)
        return from;
    else if constexpr (std::is_same_v<From, double>)
    {
        constexpr double Beyond = 2.0 * static_cast<double>(To{1} << (std::numeric_limits<To>::digits - 1));
        constexpr double Lowest = std::is_signed_v<To> ? -Beyond : 0;
        if (!(from >= Lowest && from < Beyond) || std::trunc(from) != from)
            return std::nullopt;
        return static_cast<To>(from);
    }
    else if constexpr (std::is_same_v<To, double>)
    {
        auto const to = static_cast<double>(from);
        return Exactly<From>(to) == from ? std::optional<To>(to) : std::nullopt;
    }
    else
    {
        auto const to = static_cast<To>(from);
        bool const isSame = static_cast<From>(to) == from && (to < To{}) == (from < From{});
        return isSame ? std::optional<To>(to) : std::nullopt;
    }
}

template <typename T>
Result<T> Converted(Value const& value)
{
    return std::visit(
        [&value](auto const& held) -> Result<T>
        {
            using Held = std::decay_t<decltype(held)>;
            if constexpr (std::is_same_v<T, std::string>)
                return ToText(value);
            else if constexpr (std::is_same_v<Held, T>)
                return held;
            else if constexpr (IsNumber<Held> && IsNumber<T>)
            {
                if (auto const number = Exactly<T>(held))
                    return *number;
                return Failure(OutOfRange, ToText(value));
            }
            else
                return Failure(WrongType, ToText(value));
        },
        static_cast<Value::variant const&>(value));
}

template <typename T>
Result<std::vector<T>> AllOf(List const& list)
{
    std::vector<T> all;
    for (Element const& element : list)
    {
        if (element.pos != static_cast<int>(all.size()))
            return Failure(WrongType, ListText(list));
        Result<T> one = As<T>(element.value);
        if (!one)
            return one.GetError();
        all.push_back(*std::move(one));
    }
    return all;
}
}  // namespace

bool operator==(Pointer left, Pointer right) { return left.address == right.address; }
bool operator==(Bytes const& left, Bytes const& right) { return left.bytes == right.bytes; }
bool operator==(Element const& left, Element const& right)
{
    return left.pos == right.pos && left.value == right.value;
}

bool operator==(Value const& left, Value const& right)
{
    if (left.Type() == PARAM_DOUBLE && right.Type() == PARAM_DOUBLE && std::isnan(std::get<double>(left)))
        return std::isnan(std::get<double>(right));
    return static_cast<Value::variant const&>(left) == static_cast<Value::variant const&>(right);
}

char const* NameOf(PARAM_TYPE type)
{
    // wxTRANSLATE marks them for the catalogues.
    static constexpr char const* Names[] = {
        wxTRANSLATE("none"),     wxTRANSLATE("pointer"),   wxTRANSLATE("int"),  wxTRANSLATE("double"),
        wxTRANSLATE("text"),     wxTRANSLATE("bytes"),     wxTRANSLATE("list"), wxTRANSLATE("int64"),
        wxTRANSLATE("unsigned"), wxTRANSLATE("unsigned64")};
    return type >= PARAM_NONE && type <= PARAM_UNSIGNED64 ? Names[type] : wxTRANSLATE("unknown");
}

std::string ToText(Value const& value)
{
    return std::visit(
        [](auto const& held) -> std::string
        {
            using Held = std::decay_t<decltype(held)>;
            if constexpr (IsNumber<Held>)
                return NumberText(held);
            else if constexpr (std::is_same_v<Held, std::string>)
                return held;
            else if constexpr (std::is_same_v<Held, Bytes>)
                return HexText(held.bytes);
            else if constexpr (std::is_same_v<Held, List>)
                return ListText(held);
            else if constexpr (std::is_same_v<Held, Pointer>)
            {
                char digits[32];
                auto const address = reinterpret_cast<std::uintptr_t>(held.address);
                return std::string("0x").append(digits,
                                                std::to_chars(digits, std::end(digits), address, 16).ptr);
            }
            else
                return {};
        },
        static_cast<Value::variant const&>(value));
}

Result<Value> FromText(std::string_view text, PARAM_TYPE type, PARAM_TYPE elementType)
{
    switch (type)
    {
    case PARAM_INT:
        return NumberFrom<int>(text);
    case PARAM_DOUBLE:
        return NumberFrom<double>(text);
    case PARAM_STRING:
        return Value(std::string(text));
    case PARAM_BINSTRING:
        return BytesFrom(text);
    case PARAM_INT64:
        return NumberFrom<long long>(text);
    case PARAM_UNSIGNED:
        return NumberFrom<unsigned int>(text);
    case PARAM_UNSIGNED64:
        return NumberFrom<unsigned long long>(text);
    case PARAM_COUNT:
        return elementType == PARAM_COUNT ? Result<Value>(Failure(WrongType, text))
                                          : ListFrom(text, [elementType](std::string_view field, int)
                                                     { return FromText(field, elementType); });
    default:
        return Failure(WrongType, text);
    }
}

Result<Value> FromText(std::string_view text, Value const& before)
{
    if (before.Type() == PARAM_POINTER)
        return text == ToText(before) ? Result<Value>(before) : Failure(WrongType, text);
    auto const* const list = std::get_if<List>(&before);
    if (!list || list->empty())
        return FromText(text, before.Type());
    auto const from = [list](std::string_view field, int pos)
    {
        auto const behind = std::upper_bound(list->begin(), list->end(), pos,
                                             [](int at, Element const& element) { return at < element.pos; });
        return FromText(field, behind == list->begin() ? behind->value : std::prev(behind)->value);
    };
    return ListFrom(text, from);
}

template <typename T>
Result<detail::Readable<T>> As(Value const& value)
{
    if constexpr (detail::IsOneValue<T>)
        return Converted<T>(value);
    else if (value.IsNone())
        return Failure(WrongType, {});
    else if (auto const* const list = std::get_if<List>(&value))
        return AllOf<typename T::value_type>(*list);
    else
    {
        Result<typename T::value_type> one = As<typename T::value_type>(value);
        return one ? Result<T>(T{*std::move(one)}) : Result<T>(one.GetError());
    }
}

// NOLINTBEGIN(bugprone-macro-parentheses): T is a type
#define COMGUI_CLIENT_VALUE(T)                                                                               \
    template COMGUI_EXPORT Result<T> As<T>(Value const&);                                                    \
    template COMGUI_EXPORT Result<std::vector<T>> As<std::vector<T>>(Value const&);
COMGUI_CLIENT_VALUE(int)
COMGUI_CLIENT_VALUE(double)
COMGUI_CLIENT_VALUE(std::string)
COMGUI_CLIENT_VALUE(Bytes)
COMGUI_CLIENT_VALUE(Pointer)
COMGUI_CLIENT_VALUE(long)
COMGUI_CLIENT_VALUE(unsigned long)
COMGUI_CLIENT_VALUE(long long)
COMGUI_CLIENT_VALUE(unsigned int)
COMGUI_CLIENT_VALUE(unsigned long long)
#undef COMGUI_CLIENT_VALUE
// NOLINTEND(bugprone-macro-parentheses)
}  // namespace comgui
