// Chooses keys by a table of patterns: whole keys, and beginnings of keys with a "*" behind them. Immutable,
// so for any thread.
#pragma once

#include <set>
#include <string>
#include <string_view>

namespace standin
{
class KeyFilter
{
public:
    // keys: ended by a null pointer, read during the call only. A null or empty table chooses every key.
    explicit KeyFilter(char const* const* keys);

    bool SelectsAll() const { return m_keys.empty() && m_beginnings.empty(); }
    bool Selects(std::string_view key) const;

private:
    void AddBeginning(std::string_view text);
    bool HasBeginningOf(std::string_view key) const;

    std::set<std::string, std::less<>> m_keys;
    std::set<std::string, std::less<>> m_beginnings;  // none of them begins with another
};
}  // namespace standin
