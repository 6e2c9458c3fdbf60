#include "comgui/client/SlotValue.h"

#include <stdexcept>
#include <type_traits>

namespace comgui::detail
{
Value ValueOf(PARAM_TYPE type, void const* word)
{
    if (type == PARAM_POINTER)
        return Pointer{const_cast<void*>(word)};
    if (type == PARAM_STRING && !word)
        return std::string();  // as everywhere in the library
    if (!word)
        return {};
    switch (type)
    {
    case PARAM_INT:
        return *static_cast<int const*>(word);
    case PARAM_DOUBLE:
        return *static_cast<double const*>(word);
    case PARAM_STRING:
        return std::string(static_cast<char const*>(word));
    case PARAM_BINSTRING:
    {
        auto const& bytes = *static_cast<BIN_STRING const*>(word);
        if (bytes.size > std::string().max_size())
            throw std::length_error("a value");  // before its end is computed, which is past all memory
        return bytes.data ? Bytes{{static_cast<char const*>(bytes.data), bytes.size}} : Bytes{};
    }
    case PARAM_INT64:
        return *static_cast<long long const*>(word);
    case PARAM_UNSIGNED:
        return *static_cast<unsigned int const*>(word);
    case PARAM_UNSIGNED64:
        return *static_cast<unsigned long long const*>(word);
    default:
        return {};
    }
}

void const* WordOf(Value const& value, BIN_STRING& bytes)
{
    return std::visit(
        [&bytes](auto const& held) -> void const*
        {
            using Held = std::decay_t<decltype(held)>;
            if constexpr (std::is_same_v<Held, std::monostate> || std::is_same_v<Held, List>)
                return nullptr;
            else if constexpr (std::is_same_v<Held, Pointer>)
                return held.address;
            else if constexpr (std::is_same_v<Held, std::string>)
                return held.c_str();
            else if constexpr (std::is_same_v<Held, Bytes>)
            {
                bytes.assign(held.bytes);
                return &bytes;
            }
            else
                return &held;
        },
        static_cast<Value::variant const&>(value));
}
}  // namespace comgui::detail
