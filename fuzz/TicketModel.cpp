#include "fuzz/TicketModel.h"

#include <algorithm>
#include <bit>

namespace
{
constexpr int LastPosition = 0xFFFFFF;
constexpr unsigned char Untouched = 0xA5;

std::size_t SizeOfNumber(PARAM_TYPE type) { return type == PARAM_INT || type == PARAM_UNSIGNED ? 4 : 8; }

bool IsStored(int type) { return type >= PARAM_POINTER && type <= PARAM_UNSIGNED64 && type != PARAM_COUNT; }

// How much of the place a read fills.
std::size_t SizeOfAnswer(PARAM_TYPE type)
{
    return type == PARAM_NONE                            ? sizeof(int)
           : type == PARAM_BINSTRING                     ? sizeof(BIN_STRING)
           : type == PARAM_STRING || type == PARAM_COUNT ? 8
                                                         : SizeOfNumber(type);
}

template <typename T>
std::string BytesOf(T const& number)
{
    return {reinterpret_cast<char const*>(&number), sizeof number};
}

// What a value word points at, or is.
std::string BytesAt(PARAM_TYPE type, void const* word, TEXTS* texts)
{
    if (type == PARAM_POINTER)
        return BytesOf(word);
    if (type != PARAM_STRING && type != PARAM_BINSTRING)
        return {static_cast<char const*>(word), SizeOfNumber(type)};
    BIN_STRING bytes(word, 0);
    if (type == PARAM_BINSTRING)
        bytes = *static_cast<BIN_STRING const*>(word);
    else
        bytes.size = std::strlen(static_cast<char const*>(word));
    if (texts)
        texts->Remember(bytes.data, bytes.size);
    return {static_cast<char const*>(bytes.data), bytes.size};
}

int CountOf(std::map<int, MODEL_VALUE> const& values)
{
    return values.empty() ? 0 : values.rbegin()->first + 1;
}
}  // namespace

VALUE::VALUE(INPUT& input)
{
    auto const choice = input.Take<std::uint8_t>();
    constexpr int types[] = {PARAM_NONE,      PARAM_INT,    PARAM_STRING,     PARAM_NONE,
                             PARAM_INT,       PARAM_STRING, PARAM_NONE,       PARAM_INT,
                             PARAM_BINSTRING, PARAM_DOUBLE, PARAM_INT64,      PARAM_UNSIGNED,
                             PARAM_POINTER,   PARAM_COUNT,  PARAM_UNSIGNED64, 10};
    m_type = static_cast<PARAM_TYPE>(types[choice % 16]);
    m_isNull = choice >= 0xF0;
    if (m_type == PARAM_STRING || m_type == PARAM_BINSTRING)
        m_text = m_type == PARAM_STRING ? input.Text(input.Among(40)) : input.Bytes(input.Among(40));
    m_number = input.Take<std::uint32_t>() * 0x100000001u;
    m_binary.assign(m_text);
}

void const* VALUE::Word() const
{
    if (m_type == PARAM_POINTER)
        return std::bit_cast<void const*>(m_number);
    if (m_isNull != (m_type == PARAM_NONE))
        return nullptr;
    return m_type == PARAM_STRING      ? static_cast<void const*>(m_text.c_str())
           : m_type == PARAM_BINSTRING ? static_cast<void const*>(&m_binary)
                                       : static_cast<void const*>(&m_number);
}

bool VALUE::CanBeWritten() const
{
    if (m_type == PARAM_POINTER)
        return true;
    if (m_type == PARAM_NONE)
        return Word() == nullptr;
    return IsStored(m_type) && Word() && (m_type != PARAM_BINSTRING || !m_text.empty());
}

MODEL_VALUE VALUE::Stored() const
{
    if (m_type == PARAM_STRING || m_type == PARAM_BINSTRING)
        return {m_type, m_text};
    return {m_type, BytesOf(m_number).substr(0, SizeOfNumber(m_type))};
}

bool CanBeWritten(char const* key, VALUE const& value, int pos)
{
    int const lowest = value.Type() == PARAM_NONE ? -1 : -2;
    return key && *key && pos >= lowest && pos <= LastPosition && value.CanBeWritten();
}

void Write(MODEL_TICKET& ticket, std::string const& key, VALUE const& value, int pos)
{
    auto& values = ticket[key];
    if (pos == -1)
        values.clear();
    int const place = pos == -2 ? CountOf(values) : std::max(pos, 0);
    values.erase(place);
    if (value.Type() != PARAM_NONE)
        values.emplace(place, value.Stored());
    if (values.empty())
        ticket.erase(key);
}

void TEXTS::Remember(void const* text, std::size_t size)
{
    auto const* const first = static_cast<char const*>(text);
    m_texts.emplace_back(first, std::string(first, size));
}

void TEXTS::MustStand() const
{
    for (auto const& [text, copy] : m_texts)
        COMGUI_MUST(std::memcmp(text, copy.data(), copy.size()) == 0);
}

MODEL_TICKET Walked(STICKET_ACCESS const& ticket, TEXTS* texts)
{
    struct WALK
    {
        MODEL_TICKET ticket;
        TEXTS* texts;
    } walk{{}, texts};
    auto const take = [](void* context, char const* key, PARAM_TYPE type, void const* word, int pos)
    {
        auto& [found, handedOut] = *static_cast<WALK*>(context);
        COMGUI_MUST(IsStored(type) && key && *key && pos >= 0 && pos <= LastPosition);
        bool const isNextKey = found.empty() || found.rbegin()->first < key;
        COMGUI_MUST(isNextKey ||
                    (found.rbegin()->first == key && found.rbegin()->second.rbegin()->first < pos));
        found[key].emplace(pos, MODEL_VALUE(type, BytesAt(type, word, handedOut)));
        return true;
    };
    ticket.SWALKPARAMETERS(ticket.Instance, take, &walk, "", 8000);
    return walk.ticket;
}

std::optional<std::string> Read(std::function<int(void* out)> const& slot, PARAM_TYPE type, TEXTS* texts)
{
    alignas(8) unsigned char place[24];
    std::fill(std::begin(place), std::end(place), Untouched);
    int const result = slot(place);
    COMGUI_MUST(result == 0 || result == 1);
    bool const isAsked = type == PARAM_NONE || type == PARAM_COUNT || IsStored(type);
    COMGUI_MUST(!result || isAsked);
    std::size_t const size = result ? SizeOfAnswer(type) : 0;
    COMGUI_MUST(
        std::all_of(place + size, std::end(place), [](unsigned char byte) { return byte == Untouched; }));
    if (!result)
        return std::nullopt;
    if (type != PARAM_STRING && type != PARAM_BINSTRING)
        return std::string(reinterpret_cast<char const*>(place), size);
    if (!texts)
        return std::string();
    void const* text = nullptr;
    std::memcpy(&text, place, sizeof text);
    return BytesAt(type, type == PARAM_STRING ? text : place, texts);
}

std::optional<std::string> Read(MODEL_TICKET const& ticket, char const* key, PARAM_TYPE type, int pos)
{
    auto const found = key ? ticket.find(key) : ticket.end();
    if (found == ticket.end() || pos < -1)
        return std::nullopt;
    auto const& values = found->second;
    if (type == PARAM_COUNT)
        return pos == -1 ? std::optional(BytesOf(static_cast<unsigned long>(CountOf(values)))) : std::nullopt;
    if (type == PARAM_NONE && pos == -1 && CountOf(values) > 1)
        return BytesOf(int{PARAM_COUNT});
    auto const value = values.find(std::max(pos, 0));
    if (value == values.end() || (type != PARAM_NONE && type != value->second.first))
        return std::nullopt;
    return type == PARAM_NONE ? BytesOf(int{value->second.first}) : value->second.second;
}
