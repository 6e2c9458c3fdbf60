#include "tools/comgui_validate/Value.h"

#include "tools/shared/text.h"
#include <algorithm>
#include <cstring>

namespace validate
{
namespace
{
constexpr unsigned char Pattern = 0xA5;
constexpr std::size_t MostShown = 60;

template <typename T>
Value Of(PARAM_TYPE type, T number)
{
    return {type, std::string(reinterpret_cast<char const*>(&number), sizeof number)};
}

template <typename T>
T As(std::string const& bytes)
{
    T number{};
    std::memcpy(&number, bytes.data(), std::min(bytes.size(), sizeof number));
    return number;
}

std::size_t WidthOf(PARAM_TYPE type)
{
    switch (type)
    {
    case PARAM_NONE:
    case PARAM_INT:
    case PARAM_UNSIGNED:
        return 4;
    case PARAM_BINSTRING:
        return sizeof(BIN_STRING);
    default:
        return 8;
    }
}
}  // namespace

Value Pointer(void* pointer) { return Of(PARAM_POINTER, pointer); }
Value Int(int number) { return Of(PARAM_INT, number); }
Value Double(double number) { return Of(PARAM_DOUBLE, number); }
Value Text(std::string text) { return {PARAM_STRING, std::move(text)}; }
Value Bytes(std::string bytes) { return {PARAM_BINSTRING, std::move(bytes)}; }
Value Int64(long long number) { return Of(PARAM_INT64, number); }
Value Unsigned(unsigned int number) { return Of(PARAM_UNSIGNED, number); }
Value Unsigned64(unsigned long long number) { return Of(PARAM_UNSIGNED64, number); }

std::vector<Value> const& OneOfEachType()
{
    static int target = 0;
    static std::vector<Value> const values{
        Int(-7),
        Double(0.1),
        Text("gr\xC3\xBC\xC3\x9F"),
        Bytes(std::string("a\0b\xFF", 4)),
        Int64(-7'000'000'000),
        Unsigned(4'000'000'000U),
        Unsigned64(18'000'000'000'000'000'000ULL),
        Pointer(&target),
    };
    return values;
}

std::string NameOf(PARAM_TYPE type)
{
    constexpr char const* Names[] = {"PARAM_NONE",     "PARAM_POINTER",   "PARAM_INT",   "PARAM_DOUBLE",
                                     "PARAM_STRING",   "PARAM_BINSTRING", "PARAM_COUNT", "PARAM_INT64",
                                     "PARAM_UNSIGNED", "PARAM_UNSIGNED64"};
    return type >= PARAM_NONE && type <= PARAM_UNSIGNED64 ? Names[type] : "type " + std::to_string(type);
}

std::string Shown(Value const& value)
{
    switch (value.type)
    {
    case PARAM_INT:
        return std::to_string(As<int>(value.bytes));
    case PARAM_DOUBLE:
        return tools::NumberText(As<double>(value.bytes));
    case PARAM_STRING:
        return tools::Shown(value.bytes, MostShown);
    case PARAM_BINSTRING:
        return "bytes " + tools::ShownBytes(value.bytes, MostShown);
    case PARAM_INT64:
        return std::to_string(As<long long>(value.bytes)) + " (64 bits)";
    case PARAM_UNSIGNED:
        return std::to_string(As<unsigned int>(value.bytes)) + " (unsigned)";
    case PARAM_UNSIGNED64:
        return std::to_string(As<unsigned long long>(value.bytes)) + " (unsigned, 64 bits)";
    case PARAM_POINTER:
        return "a pointer";
    default:
        return NameOf(value.type);
    }
}

std::string Shown(std::optional<Value> const& value) { return value ? Shown(*value) : "nothing"; }

WrittenWord::WrittenWord(Value const& value)
{
    if (value.type == PARAM_POINTER)
        m_word = As<void*>(value.bytes);
    else if (value.type == PARAM_BINSTRING)
    {
        m_bytes.assign(value.bytes);
        m_word = &m_bytes;
    }
    else
        m_word = value.type == PARAM_NONE ? nullptr : value.bytes.c_str();
}

ReadPlace::ReadPlace() { m_bytes.fill(Pattern); }

bool ReadPlace::IsUntouched() const
{
    return std::all_of(m_bytes.begin(), m_bytes.end(), [](unsigned char byte) { return byte == Pattern; });
}

bool ReadPlace::IsUntouchedBehind(PARAM_TYPE type) const
{
    return std::all_of(m_bytes.begin() + static_cast<std::ptrdiff_t>(WidthOf(type)), m_bytes.end(),
                       [](unsigned char byte) { return byte == Pattern; });
}

std::optional<Value> ReadPlace::As(PARAM_TYPE type) const
{
    if (type == PARAM_STRING)
    {
        char const* text = nullptr;
        std::memcpy(&text, m_bytes.data(), sizeof text);
        return text ? std::optional(Text(text)) : std::nullopt;
    }
    if (type == PARAM_BINSTRING)
        return ValueOfWord(type, m_bytes.data());
    return Value{type, std::string(reinterpret_cast<char const*>(m_bytes.data()), WidthOf(type))};
}

std::optional<Value> ValueOfWord(PARAM_TYPE type, void const* word)
{
    if (type == PARAM_POINTER)
        return Of(PARAM_POINTER, word);
    if (!word)
        return std::nullopt;
    if (type == PARAM_STRING)
        return Text(static_cast<char const*>(word));
    if (type != PARAM_BINSTRING)
        return Value{type, std::string(static_cast<char const*>(word), WidthOf(type))};
    BIN_STRING bytes;
    std::memcpy(static_cast<void*>(&bytes), word, sizeof bytes);
    return bytes.valid() ? std::optional(Bytes(std::string(static_cast<char const*>(bytes.data), bytes.size)))
                         : std::nullopt;
}
}  // namespace validate
