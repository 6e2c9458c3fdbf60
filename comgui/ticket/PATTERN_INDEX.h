// Finds out by hash whether a PARTIAL_MODE's patterns select a key, which takes about the same time however
// many there are. Making it costs as much as some questions to the sets, so it is made once as many have been
// asked as there are patterns. Many threads may ask at once while none changes anything.
#pragma once

#include <atomic>
#include <cstddef>
#include <functional>
#include <set>
#include <string>
#include <string_view>

class STRINGPREFIXSET;

namespace comgui::detail
{
class PATTERN_INDEX
{
public:
    using KEYS = std::set<std::string, std::less<>>;

    PATTERN_INDEX() = default;
    ~PATTERN_INDEX() { Drop(); }

    // It points into the patterns of its own filter, so another one begins without.
    PATTERN_INDEX(PATTERN_INDEX const&) noexcept {}
    PATTERN_INDEX(PATTERN_INDEX&& other) noexcept { other.Drop(); }
    // Assigned to itself, too: a set that is moved to itself may be empty then.
    PATTERN_INDEX& operator=(PATTERN_INDEX const&) noexcept;  // NOLINT(cert-oop54-cpp)
    PATTERN_INDEX& operator=(PATTERN_INDEX&& other) noexcept;

    // To be called before the patterns change.
    void Drop() noexcept;

    // Whether one of the patterns selects the key. They are those of the call before, unless Drop() was
    // called since.
    bool Selects(std::string_view key, KEYS const& keys, STRINGPREFIXSET const& prefixes) const;

private:
    class TABLE;

    TABLE const* Table(KEYS const& keys, STRINGPREFIXSET const& prefixes) const;

    mutable std::atomic<TABLE const*> m_table{nullptr};
    mutable std::atomic<std::size_t> m_asked{0};  // without a table
};
}  // namespace comgui::detail
