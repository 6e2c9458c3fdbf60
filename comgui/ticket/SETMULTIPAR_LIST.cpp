#include "comgui/ticket/SETMULTIPAR_LIST.h"

#include "comgui/foundation/MathLib.h"
#include "comgui/foundation/number_bits.h"
#include <algorithm>

SETMULTIPAR_LIST::SETMULTIPAR_LIST(bool copyValues) : m_copyValues(copyValues) {}

SETMULTIPAR_LIST::~SETMULTIPAR_LIST() { freeTbl(); }

int SETMULTIPAR_LIST::xSetParameter(char const* key, PARAM_TYPE type, void const* value, int pos)
{
    return Add(m_keyCache[key], type, Cached(type, value), pos);
}

int SETMULTIPAR_LIST::ySetParameter(char const* key, PARAM_TYPE type, void const* value, int pos)
{
    if (pos == 0)
        pos = -1;
    bool const isCopied = m_copyValues || type == PARAM_BINSTRING || type == PARAM_INT;
    return Add(m_keyCache[key], type, isCopied ? Cached(type, value) : value, pos);
}

int SETMULTIPAR_LIST::SetParameter(char const* key, int value, int pos)
{
    return xSetParameter(key, PARAM_INT, &value, pos);
}

int SETMULTIPAR_LIST::SetParameter(char const* key, double value, int pos)
{
    return xSetParameter(key, PARAM_DOUBLE, &value, pos);
}

int SETMULTIPAR_LIST::SetParameter(char const* key, std::string const& value, int pos)
{
    return xSetParameter(key, PARAM_STRING, value.c_str(), pos);
}

int SETMULTIPAR_LIST::SetParameter(char const* key, wxString const& value, int pos)
{
    return xSetParameter(key, PARAM_STRING, value.utf8_str(), pos);
}

int SETMULTIPAR_LIST::SetParameter(char const* key, BIN_STRING const& value, int pos)
{
    return xSetParameter(key, PARAM_BINSTRING, &value, pos);
}

int SETMULTIPAR_LIST::DelParameter(char const* key, int pos)
{
    return xSetParameter(key, PARAM_NONE, nullptr, pos);
}

void const* SETMULTIPAR_LIST::Cached(PARAM_TYPE type, void const* value)
{
    if (value == nullptr)
        return nullptr;
    switch (type)
    {
    case PARAM_INT:
        return m_intCache.Keep(*static_cast<int const*>(value));
    case PARAM_DOUBLE:
        return Cached(*static_cast<double const*>(value));
    case PARAM_STRING:
        return m_stringCache[static_cast<char const*>(value)];
    case PARAM_BINSTRING:
        return m_binCache.Keep(*static_cast<BIN_STRING const*>(value));
    case PARAM_INT64:
        return m_int64Cache.Keep(*static_cast<long long const*>(value));
    case PARAM_UNSIGNED:
        return m_unsignedCache.Keep(*static_cast<unsigned int const*>(value));
    case PARAM_UNSIGNED64:
        return m_unsigned64Cache.Keep(*static_cast<unsigned long long const*>(value));
    default:
        return value;
    }
}

// All that is no number is one value: a NaN could not be found again.
void const* SETMULTIPAR_LIST::Cached(double value)
{
    if (comgui::detail::IsNotANumber(value))
        return &MathLib::NOT_A_DOUBLE_NUMBER;
    return m_doubleCache.Keep(value);
}

SETMULTIPAR* SETMULTIPAR_LIST::Table(bool sort)
{
    if (sort && !m_isSorted)
        freeTbl();
    if (m_table == nullptr && m_records.Size() != 0)
    {
        m_table = new SETMULTIPAR[m_records.Size() + 1];
        SETMULTIPAR* const end = m_records.CopyTo(m_table);
        *end = SETMULTIPAR{};
        m_isSorted = sort;
        if (sort && !std::is_sorted(m_table, end))
        {
            std::stable_sort(m_table, end);
            m_records.CopyFrom(m_table);
        }
    }
    return m_table;
}

void SETMULTIPAR_LIST::Clear()
{
    freeTbl();
    m_records.Clear();
    m_keyCache.clear();
    m_intCache.clear();
    m_unsignedCache.clear();
    m_int64Cache.clear();
    m_unsigned64Cache.clear();
    m_doubleCache.clear();
    m_stringCache.clear();
    m_binCache.clear();
    m_pool.Clear();
}

void SETMULTIPAR_LIST::freeTbl()
{
    delete[] m_table;
    m_table = nullptr;
    m_isSorted = false;
}

bool SETMULTIPAR_LIST::CollectAction(void* list, char const* key, PARAM_TYPE type, void const* value, int pos)
{
    if (comgui::detail::IsParameter(type))
        static_cast<SETMULTIPAR_LIST*>(list)->ySetParameter(key, type, value, pos);
    return true;
}
