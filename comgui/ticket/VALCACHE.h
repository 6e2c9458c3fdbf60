// Keeps each distinct number once and gives out its address. 0.0 and -0.0 are one number, the first of them
// that came. NaN equals nothing, so keep it out. Otherwise as STRINGCACHE.
#pragma once

#include "comgui/foundation/export.h"
#include <memory>

// T: int, unsigned int, long long, unsigned long long or double.
template <typename T>
class COMGUI_EXPORT VALCACHE
{
public:
    VALCACHE() noexcept;
    VALCACHE(VALCACHE const&) = delete;
    VALCACHE& operator=(VALCACHE const&) = delete;
    ~VALCACHE();

    // Replaces number by the address of the cached copy, and returns that address. Null stays null.
    T const* operator()(T const*& number) { return number ? number = Keep(*number) : nullptr; }

    // The address of the cached copy.
    T const* Keep(T number);

    // Drops all numbers; every address given out dies.
    void clear();

private:
    struct VALUES;
    std::unique_ptr<VALUES> m_values;  // null until the first number comes
};

extern template class VALCACHE<int>;
extern template class VALCACHE<unsigned int>;
extern template class VALCACHE<long long>;
extern template class VALCACHE<unsigned long long>;
extern template class VALCACHE<double>;
