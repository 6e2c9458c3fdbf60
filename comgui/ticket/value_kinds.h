// The kinds of values that lists and caches keep, for VALUE_INDEX.
#pragma once

#include "comgui/foundation/short_copy.h"
#include "comgui/ticket/BIN_STRING.h"
#include "comgui/ticket/VALUE_INDEX.h"
#include <cstring>
#include <new>
#include <string_view>
#include <type_traits>

namespace comgui::detail
{
struct TEXT
{
    using VALUE = std::string_view;  // without zero bytes
    struct ENTRY
    {
        char const* text;
        std::size_t size;
        HASH hash;
    };

    static HASH Hash(VALUE text, HASH seed) { return HashOfBytes(text.data(), text.size(), seed); }
    static HASH HashOf(ENTRY const& entry, HASH) { return entry.hash; }
    static bool Same(ENTRY const& entry, VALUE text)
    {
        return entry.size == text.size() && SameBytes(entry.text, text.data(), text.size());
    }
    static ENTRY* Make(void* place, VALUE text, HASH hash, POOL& pool)
    {
        char* const copy = static_cast<char*>(pool.Take(text.size() + 1, 1));
        Copy(copy, text.data(), text.size());
        copy[text.size()] = '\0';
        return new (place) ENTRY{copy, text.size(), hash};
    }
};

// 0.0 and -0.0 are one number, the first of them that came. NaN equals nothing, so it must be kept out.
template <typename T>
struct NUMBER
{
    using VALUE = T;
    using ENTRY = T;

    static HASH Hash(T number, HASH seed)
    {
        if constexpr (std::is_floating_point_v<T>)
            number += T(0);  // turns -0.0 into 0.0
        HASH bits = 0;
        std::memcpy(&bits, &number, sizeof number);
        return HashOfNumber(bits, seed);
    }
    static HASH HashOf(T number, HASH seed) { return Hash(number, seed); }
    static bool Same(T entry, T number) { return entry == number; }
    static T* Make(void* place, T number, HASH, POOL&) { return new (place) T(number); }
};

struct BINARY
{
    using VALUE = BIN_STRING;  // all that are not valid are one, of size 0
    struct ENTRY
    {
        BIN_STRING view;
        HASH hash;
    };

    static VALUE Of(BIN_STRING value) { return value.valid() ? value : BIN_STRING(); }

    static HASH Hash(VALUE value, HASH seed)
    {
        return HashOfBytes(static_cast<char const*>(value.data), value.size, seed);
    }
    static HASH HashOf(ENTRY const& entry, HASH) { return entry.hash; }
    static bool Same(ENTRY const& entry, VALUE value)
    {
        return entry.view.size == value.size && SameBytes(static_cast<char const*>(entry.view.data),
                                                          static_cast<char const*>(value.data), value.size);
    }
    static ENTRY* Make(void* place, VALUE value, HASH hash, POOL& pool)
    {
        if (value.size != 0)
            value.data = std::memcpy(pool.Take(value.size, 1), value.data, value.size);
        return new (place) ENTRY{value, hash};
    }
};

// Values together with their memory.
template <typename KIND>
struct OWN_VALUES
{
    void Clear()
    {
        index.Clear();
        pool.Clear();
    }

    POOL pool;
    VALUE_INDEX<KIND> index{pool};
};
}  // namespace comgui::detail
