#include "comgui/access/MTICKET_MODIFY.h"

#include "comgui/access/list_conversions.h"
#include "comgui/access/list_templates.h"
#include "comgui/access/variant_bridge.h"

// The plain element types: jumps into the templates.
#define COMGUI_WRITES(T)                                                                                     \
    bool MTICKET_MODIFY::SetVectorParameter(int type, int id, char const* key, std::vector<T> const& in)     \
        const                                                                                                \
    {                                                                                                        \
        return xSetVectorParameter(*Access(), type, id, key, in);                                            \
    }                                                                                                        \
    bool MTICKET_MODIFY::SetArrayParameter(int type, int id, char const* key, T const* in,                   \
                                           unsigned long count) const                                        \
    {                                                                                                        \
        return xSetArrayParameter(*Access(), type, id, key, in, count);                                      \
    }
COMGUI_WRITES(int)
COMGUI_WRITES(unsigned int)
COMGUI_WRITES(long long)
COMGUI_WRITES(unsigned long long)
COMGUI_WRITES(double)

bool MTICKET_MODIFY::SetVectorParameter(int type, int id, char const* key, std::vector<void*> const& in) const
{
    return xpSetVectorParameter(*Access(), type, id, key, in);
}

bool MTICKET_MODIFY::SetArrayParameter(int type, int id, char const* key, void* const* in,
                                       unsigned long count) const
{
    return xpSetArrayParameter(*Access(), type, id, key, in, count);
}

bool MTICKET_MODIFY::SetVectorParameter(int type, int id, char const* key, std::vector<bool> const& in) const
{
    return comgui::detail::WriteBools(Slots(type, id), key, in);
}

bool MTICKET_MODIFY::SetVectorParameter(int type, int id, char const* key,
                                        std::vector<wxString> const& in) const
{
    return comgui::detail::WriteTexts(Slots(type, id), key, in);
}

bool MTICKET_MODIFY::SetArrayParameter(int type, int id, char const* key, bool const* in,
                                       unsigned long count) const
{
    return comgui::detail::WriteBoolArray(Slots(type, id), key, in, count);
}

bool MTICKET_MODIFY::SetWxArrayParameter(int type, int id, char const* key, wxArrayString const& in) const
{
    return comgui::detail::WriteWxArray(Slots(type, id), key, in);
}

bool MTICKET_MODIFY::SetWxArrayParameter(int type, int id, char const* key, wxArrayInt const& in) const
{
    return comgui::detail::WriteWxArray(Slots(type, id), key, in);
}

bool MTICKET_MODIFY::SetWxVariantParameter(int type, int id, char const* key, wxVariant const& value,
                                           int pos) const
{
    return comgui::detail::WriteVariant(Slots(type, id), key, value, pos);
}
