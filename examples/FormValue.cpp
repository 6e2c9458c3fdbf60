#include "FormValue.h"

#include "Shown.h"
#include <algorithm>
#include <cctype>
#include <charconv>
#include <cmath>
#include <cstdlib>
#include <limits>

std::string Quoted(std::string const& text) { return "\"" + Shown(text) + "\""; }

namespace
{
struct TYPE_NAME
{
    char const* name;
    PARAM_TYPE type;
    bool isWritten;
};

constexpr TYPE_NAME Types[] = {
    {"int", PARAM_INT, true},           {"double", PARAM_DOUBLE, true},
    {"text", PARAM_STRING, true},       {"int64", PARAM_INT64, true},
    {"unsigned", PARAM_UNSIGNED, true}, {"unsigned64", PARAM_UNSIGNED64, true},
    {"bytes", PARAM_BINSTRING, false},  {"pointer", PARAM_POINTER, false},
    {"list", PARAM_COUNT, false},
};

[[noreturn]] void Refuse(std::string const& key, PARAM_TYPE type, std::string const& text)
{
    throw Refusal(key + ": " + Quoted(text) + " is not what it takes: " + WhatItTakes(type));
}

template <typename Number>
std::string Range(char const* name)
{
    using Limits = std::numeric_limits<Number>;
    return std::string(name) + ", a whole number from " + std::to_string(Limits::min()) + " to " +
           std::to_string(Limits::max());
}

template <typename Number>
void AddWhole(SETMULTIPAR_LIST& list, std::string const& key, PARAM_TYPE type, std::string const& text,
              int pos)
{
    Number number = 0;
    auto const [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
    if (error != std::errc() || end != text.data() + text.size())
        Refuse(key, type, text);
    list.xSetParameter(key.c_str(), type, &number, pos);
}

void AddDouble(SETMULTIPAR_LIST& list, std::string const& key, std::string const& text, int pos)
{
    char* end = nullptr;
    double const number = std::strtod(text.c_str(), &end);
    bool const isWhole = !text.empty() && std::isspace(static_cast<unsigned char>(text[0])) == 0 &&
                         end == text.c_str() + text.size();
    // The server takes what is no number for a missing one.
    if (!isWhole || !std::isfinite(number))
        Refuse(key, PARAM_DOUBLE, text);
    list.SetParameter(key.c_str(), number, pos);
}

// A value of a list, which is left at the comma behind it, or at the end.
std::string TakeBare(std::string const& key, std::string const& text, std::size_t& from)
{
    std::size_t const end = std::min(text.find(',', from), text.size());
    std::string value = text.substr(from, end - from);
    if (value.find('"') != std::string::npos)
        throw Refusal(key + ": a quote stands within " + value +
                      "; put the whole value in quotes, and write this one twice");
    from = end;
    return value;
}

// The same.
std::string TakeQuoted(std::string const& key, std::string const& text, std::size_t& from)
{
    std::string value;
    std::size_t i = from + 1;
    for (; i < text.size(); ++i)
        if (text[i] != '"')
            value += text[i];
        else if (text.compare(i, 2, "\"\"") == 0)
            value += text[i++];
        else
            break;
    if (i == text.size())
        throw Refusal(key + ": a quote in " + text + " has no end; within quotes one is written twice");
    if (i + 1 < text.size() && text[i + 1] != ',')
        throw Refusal(key + ": a comma must follow " + text.substr(from, i + 1 - from) +
                      "; within quotes a quote is written twice");
    from = i + 1;
    return value;
}
}  // namespace

char const* NameOf(int type)
{
    for (TYPE_NAME const& known : Types)
        if (known.type == type)
            return known.name;
    return "none";
}

PARAM_TYPE TypeOf(std::string const& name)
{
    std::string names;
    for (TYPE_NAME const& known : Types)
    {
        if (!known.isWritten)
            continue;
        if (known.name == name)
            return known.type;
        names += names.empty() ? "" : ", ";
        names += known.name;
    }
    throw Refusal("there is no type " + Quoted(name) + "; the types are " + names);
}

std::string WhatItTakes(PARAM_TYPE type)
{
    switch (type)
    {
    case PARAM_INT:
        return Range<int>("an int");
    case PARAM_UNSIGNED:
        return Range<unsigned int>("an unsigned");
    case PARAM_INT64:
        return Range<long long>("an int64");
    case PARAM_UNSIGNED64:
        return Range<unsigned long long>("an unsigned64");
    case PARAM_DOUBLE:
        return "a double, a number such as -12.5 or 1e6";
    case PARAM_STRING:
        return "a text in UTF-8";
    default:
        return std::string("nothing that can be written here, since its type is ") + NameOf(type);
    }
}

void AddValue(SETMULTIPAR_LIST& list, std::string const& key, PARAM_TYPE type, std::string const& text,
              int pos)
{
    switch (type)
    {
    case PARAM_INT:
        return AddWhole<int>(list, key, type, text, pos);
    case PARAM_UNSIGNED:
        return AddWhole<unsigned int>(list, key, type, text, pos);
    case PARAM_INT64:
        return AddWhole<long long>(list, key, type, text, pos);
    case PARAM_UNSIGNED64:
        return AddWhole<unsigned long long>(list, key, type, text, pos);
    case PARAM_DOUBLE:
        return AddDouble(list, key, text, pos);
    case PARAM_STRING:
        if (!text.empty() && wxString::FromUTF8(text.c_str()).empty())
            Refuse(key, type, text);
        list.SetParameter(key.c_str(), text, pos);
        return;
    default:
        Refuse(key, type, text);
    }
}

std::pair<std::string, std::string> SplitField(std::string const& field)
{
    std::size_t const equals = field.find('=');
    if (equals == std::string::npos || equals == 0)
        throw Refusal(Quoted(field) + " is not KEY=VALUE");
    return {field.substr(0, equals), field.substr(equals + 1)};
}

std::vector<std::string> SplitList(std::string const& key, std::string const& text)
{
    std::vector<std::string> values;
    if (text.empty())
        return values;
    std::size_t from = 0;
    for (bool isMore = true; isMore; ++from)  // past the comma
    {
        values.push_back(from < text.size() && text[from] == '"' ? TakeQuoted(key, text, from)
                                                                 : TakeBare(key, text, from));
        isMore = from < text.size();
    }
    return values;
}
