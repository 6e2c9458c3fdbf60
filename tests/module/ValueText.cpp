#include "tests/module/ValueText.h"

#include "comgui/ticket/BIN_STRING.h"
#include <cstdint>

std::string TextOf(PARAM_TYPE type, void const* word)
{
    switch (type)
    {
    case PARAM_NONE:
        return word ? "not null" : "none";
    case PARAM_INT:
        return std::to_string(*static_cast<int const*>(word));
    case PARAM_DOUBLE:
        return std::to_string(*static_cast<double const*>(word));
    case PARAM_INT64:
        return std::to_string(*static_cast<long long const*>(word)) + "ll";
    case PARAM_UNSIGNED:
        return std::to_string(*static_cast<unsigned const*>(word)) + "u";
    case PARAM_UNSIGNED64:
        return std::to_string(*static_cast<unsigned long long const*>(word)) + "ull";
    case PARAM_POINTER:
        return "->" + std::to_string(reinterpret_cast<std::uintptr_t>(word));
    case PARAM_STRING:
        return "'" + std::string(static_cast<char const*>(word)) + "'";
    case PARAM_BINSTRING:
    {
        auto const& bytes = *static_cast<BIN_STRING const*>(word);
        return "[" + std::string(static_cast<char const*>(bytes.data), bytes.size) + "]";
    }
    default:
        return "of type " + std::to_string(type);
    }
}

std::vector<std::string> ContentOf(STICKET_ACCESS const* ticket)
{
    std::vector<std::string> content;
    auto const add = [](void* context, char const* key, PARAM_TYPE type, void const* word, int pos)
    {
        static_cast<std::vector<std::string>*>(context)->push_back(
            std::string(key) + "@" + std::to_string(pos) + "=" + TextOf(type, word));
        return true;
    };
    ticket->SWALKPARAMETERS(ticket->Instance, add, &content, nullptr, 0);
    return content;
}
