#include "comgui/module/Words.h"

namespace comgui::plugin
{
namespace
{
template <typename T>
Value NumberAt(void const* word)
{
    return *static_cast<T const*>(word);
}

Value NumberOf(PARAM_TYPE type, void const* word)
{
    switch (type)
    {
    case PARAM_INT:
        return NumberAt<int>(word);
    case PARAM_DOUBLE:
        return NumberAt<double>(word);
    case PARAM_INT64:
        return NumberAt<long long>(word);
    case PARAM_UNSIGNED:
        return NumberAt<unsigned int>(word);
    case PARAM_UNSIGNED64:
        return NumberAt<unsigned long long>(word);
    default:
        return {};
    }
}

struct WordOfAlternative
{
    BIN_STRING& bytes;

    void const* operator()(std::monostate) const { return nullptr; }
    void const* operator()(NeverStored) const { return nullptr; }
    void const* operator()(void* const& pointer) const { return pointer; }
    void const* operator()(std::string const& text) const { return text.c_str(); }
    void const* operator()(Bytes const& value) const
    {
        bytes = BIN_STRING(value.bytes.data(), value.bytes.size());
        return &bytes;
    }
    template <typename Number>
    void const* operator()(Number const& number) const
    {
        return &number;
    }
};
}  // namespace

std::optional<Value> ValueOf(PARAM_TYPE type, void const* word)
{
    if (type == PARAM_POINTER)  // the word itself is the pointer, and may well be null
        return Value(const_cast<void*>(word));
    if (type == PARAM_NONE)
        return word ? std::nullopt : std::optional(Value());
    if (!word)
        return std::nullopt;
    if (type == PARAM_STRING)
        return Value(std::string(static_cast<char const*>(word)));
    if (type == PARAM_BINSTRING)
    {
        auto const& bytes = *static_cast<BIN_STRING const*>(word);
        if (!bytes.data || !bytes.size)
            return std::nullopt;
        return Value(Bytes{std::string(static_cast<char const*>(bytes.data), bytes.size)});
    }
    Value number = NumberOf(type, word);
    return IsNone(number) ? std::nullopt : std::optional(std::move(number));
}

void const* WordOf(Value const& value, BIN_STRING& bytes)
{
    return std::visit(WordOfAlternative{bytes}, value);
}
}  // namespace comgui::plugin
