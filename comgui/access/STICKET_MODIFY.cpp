#include "comgui/access/STICKET_MODIFY.h"

#include "comgui/access/list_conversions.h"
#include "comgui/access/list_templates.h"
#include "comgui/access/variant_bridge.h"

int STICKET_MODIFY::SetParameter(char const* key, wxString const& value, int pos) const
{
    return Slots().Set(key, PARAM_STRING, value.utf8_str(), pos);
}

// The plain element types: jumps into the templates.
#define COMGUI_WRITES(T)                                                                                     \
    bool STICKET_MODIFY::SetVectorParameter(char const* key, std::vector<T> const& in) const                 \
    {                                                                                                        \
        return xSetVectorParameter(*Access(), key, in);                                                      \
    }                                                                                                        \
    bool STICKET_MODIFY::SetArrayParameter(char const* key, T const* in, unsigned long count) const          \
    {                                                                                                        \
        return xSetArrayParameter(*Access(), key, in, count);                                                \
    }
COMGUI_WRITES(int)
COMGUI_WRITES(unsigned int)
COMGUI_WRITES(long long)
COMGUI_WRITES(unsigned long long)
COMGUI_WRITES(double)

bool STICKET_MODIFY::SetVectorParameter(char const* key, std::vector<void*> const& in) const
{
    return xpSetVectorParameter(*Access(), key, in);
}

bool STICKET_MODIFY::SetArrayParameter(char const* key, void* const* in, unsigned long count) const
{
    return xpSetArrayParameter(*Access(), key, in, count);
}

bool STICKET_MODIFY::SetVectorParameter(char const* key, std::vector<bool> const& in) const
{
    return comgui::detail::WriteBools(Slots(), key, in);
}

bool STICKET_MODIFY::SetVectorParameter(char const* key, std::vector<wxString> const& in) const
{
    return comgui::detail::WriteTexts(Slots(), key, in);
}

bool STICKET_MODIFY::SetArrayParameter(char const* key, bool const* in, unsigned long count) const
{
    return comgui::detail::WriteBoolArray(Slots(), key, in, count);
}

bool STICKET_MODIFY::SetWxArrayParameter(char const* key, wxArrayString const& in) const
{
    return comgui::detail::WriteWxArray(Slots(), key, in);
}

bool STICKET_MODIFY::SetWxArrayParameter(char const* key, wxArrayInt const& in) const
{
    return comgui::detail::WriteWxArray(Slots(), key, in);
}

bool STICKET_MODIFY::SetWxVariantParameter(char const* key, wxVariant const& value, int pos) const
{
    return comgui::detail::WriteVariant(Slots(), key, value, pos);
}
