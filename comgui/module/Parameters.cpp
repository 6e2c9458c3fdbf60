#include "comgui/module/Parameters.h"

namespace comgui::plugin
{
Value Parameters::Read(std::string_view key, int pos) const
{
    auto const values = m_values.find(key);
    if (values == m_values.end())
        return {};
    auto const value = values->second.find(pos);
    return value == values->second.end() ? Value() : value->second;
}

int Parameters::Count(std::string_view key) const
{
    auto const values = m_values.find(key);
    return values == m_values.end() ? 0 : values->second.rbegin()->first + 1;
}

bool Parameters::Write(std::string_view key, Value const& value, int pos)
{
    if (key.empty() || pos < -2 || pos > LargestPosition || TypeOf(value) == PARAM_COUNT)
        return false;
    if (IsNone(value))
        return Delete(key, pos);
    int const place = pos == -2 ? Count(key) : pos == -1 ? 0 : pos;
    if (place > LargestPosition)
        return false;
    auto values = m_values.find(key);
    if (values == m_values.end())
        values = m_values.emplace(key, Values()).first;
    else if (pos == -1)
        values->second.clear();
    values->second.insert_or_assign(place, value);
    return true;
}

bool Parameters::Delete(std::string_view key, int pos)
{
    if (pos == -2)
        return false;
    auto const values = m_values.find(key);
    if (values == m_values.end())
        return true;
    if (pos >= 0)
        values->second.erase(pos);
    if (pos == -1 || values->second.empty())
        m_values.erase(values);
    return true;
}

std::vector<Parameter> Parameters::All(std::string_view prefix) const
{
    std::vector<Parameter> all;
    for (auto entry = m_values.lower_bound(prefix);
         entry != m_values.end() && std::string_view(entry->first).substr(0, prefix.size()) == prefix;
         ++entry)
        for (auto const& [pos, value] : entry->second)
            all.push_back({entry->first, value, pos});
    return all;
}
}  // namespace comgui::plugin
