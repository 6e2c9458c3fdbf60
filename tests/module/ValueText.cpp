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
