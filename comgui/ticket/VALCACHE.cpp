#include "comgui/ticket/VALCACHE.h"

#include "comgui/ticket/value_kinds.h"

template <typename T>
struct VALCACHE<T>::VALUES : comgui::detail::OWN_VALUES<comgui::detail::NUMBER<T>>
{
};

template <typename T>
VALCACHE<T>::VALCACHE() noexcept = default;
template <typename T>
VALCACHE<T>::~VALCACHE() = default;

template <typename T>
T const* VALCACHE<T>::Keep(T number)
{
    if (!m_values)
        m_values = std::make_unique<VALUES>();
    return &m_values->index.Keep(number);
}

template <typename T>
void VALCACHE<T>::clear()
{
    if (m_values)
        m_values->Clear();
}

template class VALCACHE<int>;
template class VALCACHE<unsigned int>;
template class VALCACHE<long long>;
template class VALCACHE<unsigned long long>;
template class VALCACHE<double>;
