// The values of one ticket in memory, by the rules that hold for tickets: what a write at a position does,
// what counts as the number of values, and what a deletion leaves. A plain value; for one thread at a time.
#pragma once

#include "comgui/module/Value.h"
#include <cstddef>
#include <map>
#include <string>
#include <string_view>
#include <vector>

namespace comgui::plugin
{
class Parameters
{
public:
    // The value at that position of the key, from 0; none if there is none.
    Value Read(std::string_view key, int pos) const;

    // One more than the largest position, 0 without a value.
    int Count(std::string_view key) const;

    // pos: -1 the key as a whole, 0 and above one value, -2 behind the last one. No value deletes; to delete
    // what is not there succeeds. False for what no ticket holds: an empty key, another position, no value at
    // -2.
    bool Write(std::string_view key, Value const& value, int pos);

    // Those whose keys begin with the prefix, by key bytewise, then by position.
    std::vector<Parameter> All(std::string_view prefix = {}) const;

    bool IsEmpty() const { return m_values.empty(); }

private:
    bool Delete(std::string_view key, int pos);

    using Values = std::map<int, Value>;  // by position, never empty
    std::map<std::string, Values, std::less<>> m_values;
};
}  // namespace comgui::plugin
