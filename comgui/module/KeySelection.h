// A choice of keys that a host has sent as a table: whole keys, and beginnings of keys with a "*" behind
// them. A copy: the host's table may go.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace comgui::plugin
{
class KeySelection
{
public:
    KeySelection() = default;  // every key

    // keys: ended by a null pointer. A null or empty table selects every key.
    explicit KeySelection(char const* const* keys);

    bool SelectsAll() const { return m_patterns.empty(); }
    bool Selects(std::string_view key) const;

private:
    std::vector<std::string> m_patterns;
};
}  // namespace comgui::plugin
