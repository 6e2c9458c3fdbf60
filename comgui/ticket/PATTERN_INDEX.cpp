#include "comgui/ticket/PATTERN_INDEX.h"

#include "comgui/foundation/TEXT_TABLE.h"
#include "comgui/ticket/PARTIAL_MODE.h"
#include <algorithm>
#include <cstdint>
#include <memory>
#include <new>
#include <vector>

namespace comgui::detail
{
class PATTERN_INDEX::TABLE
{
public:
    TABLE(KEYS const& keys, STRINGPREFIXSET const& prefixes)
        : m_sizes(SizesOf(prefixes)), m_holdsPrefixes(m_sizes.size() <= MostSizes),
          m_patterns(keys.size() + (m_holdsPrefixes ? prefixes.size() : 0))
    {
        for (std::string const& key : keys)
            Add(key, WHOLE);
        if (m_holdsPrefixes)
            for (std::string const& prefix : prefixes)
                Add(prefix, PREFIX);
        else
            m_sizes.clear();
    }

    // With prefixes of too many sizes, to look for each size would take longer than the set of them.
    bool HoldsPrefixes() const { return m_holdsPrefixes; }

    bool Selects(std::string_view key) const
    {
        BEGINNINGS beginnings(key, m_patterns.Seed());
        for (auto const& [size, lastBytes] : m_sizes)
        {
            if (size > key.size())
                break;
            std::string_view const prefix = key.substr(0, size);
            if ((lastBytes & LastByte(prefix)) && Find(prefix, beginnings.HashOf(size), PREFIX))
                return true;
        }
        return Find(key, beginnings.HashOf(key.size()), WHOLE);
    }

private:
    enum KIND : HASH
    {
        WHOLE = 0,
        PREFIX = HASH(1) << 63,  // a difference of the hash, not of its place
    };

    // A set of bytes: one may be in it if the bit is set that its lower six bits say.
    using BYTES = std::uint64_t;

    struct SIZE
    {
        std::size_t size;
        BYTES lastBytes;  // of the prefixes of that size
    };
    static constexpr std::size_t MostSizes = 16;

    // Prefixes mostly end at a separator, and keys mostly have none there: so few are looked for.
    static BYTES LastByte(std::string_view text) { return BYTES(1) << (text.empty() ? 0 : text.back() & 63); }

    // The smallest first, and one more than MostSizes at most.
    static std::vector<SIZE> SizesOf(STRINGPREFIXSET const& prefixes)
    {
        std::vector<SIZE> sizes;
        for (std::string const& prefix : prefixes)
        {
            auto const place = std::ranges::lower_bound(sizes, prefix.size(), {}, &SIZE::size);
            if (place != sizes.end() && place->size == prefix.size())
                place->lastBytes |= LastByte(prefix);
            else if (sizes.size() <= MostSizes)
                sizes.insert(place, {prefix.size(), LastByte(prefix)});
        }
        return sizes;
    }

    void Add(std::string const& pattern, KIND kind)
    {
        HASH const hash = BEGINNINGS(pattern, m_patterns.Seed()).HashOf(pattern.size());
        m_patterns.Add(pattern, hash ^ kind, 0);
    }

    bool Find(std::string_view text, HASH hash, KIND kind) const
    {
        return m_patterns.Find(text, hash ^ kind) != TEXT_TABLE::None;
    }

    std::vector<SIZE> m_sizes;  // of the prefixes that it holds
    bool m_holdsPrefixes;
    TEXT_TABLE m_patterns;
};

PATTERN_INDEX& PATTERN_INDEX::operator=(PATTERN_INDEX const&) noexcept  // NOLINT(cert-oop54-cpp)
{
    Drop();
    return *this;
}

PATTERN_INDEX& PATTERN_INDEX::operator=(PATTERN_INDEX&& other) noexcept
{
    other.Drop();
    Drop();
    return *this;
}

void PATTERN_INDEX::Drop() noexcept
{
    delete m_table.exchange(nullptr, std::memory_order_relaxed);
    m_asked.store(0, std::memory_order_relaxed);
}

bool PATTERN_INDEX::Selects(std::string_view key, KEYS const& keys, STRINGPREFIXSET const& prefixes) const
{
    TABLE const* const table = Table(keys, prefixes);
    bool const isKnown = table ? table->Selects(key) : keys.find(key) != keys.end();
    return isKnown || ((table == nullptr || !table->HoldsPrefixes()) && prefixes.Covers(key));
}

PATTERN_INDEX::TABLE const* PATTERN_INDEX::Table(KEYS const& keys, STRINGPREFIXSET const& prefixes) const
{
    TABLE const* table = m_table.load(std::memory_order_acquire);
    if (table || m_asked.fetch_add(1, std::memory_order_relaxed) < keys.size() + prefixes.size())
        return table;
    try
    {
        auto made = std::make_unique<TABLE const>(keys, prefixes);
        // Another thread may have been quicker.
        if (m_table.compare_exchange_strong(table, made.get(), std::memory_order_acq_rel))
            table = made.release();
    }
    catch (std::bad_alloc const&)  // the sets have the answer, too
    {
        m_asked.store(0, std::memory_order_relaxed);
    }
    return table;
}
}  // namespace comgui::detail
