#include "comgui/access/STICKET_READ.h"

#include "comgui/access/decode.h"
#include "comgui/access/list_conversions.h"
#include "comgui/access/list_templates.h"
#include "comgui/access/variant_bridge.h"
#include <type_traits>

bool STICKET_READ::GetParameter(char const* key, wxString& value, int pos) const
{
    return comgui::detail::ReadText(Slots(), key, value, pos);
}

bool STICKET_READ::WhoAmI(STICKET_OPTION_WHOAMI& who) const
{
    // The lowest bit is what counts, so a module that answers 2 has failed.
    if (Access()->SOPTION(Access()->Instance, STICKET_OP_WHOAMI, &who) & 1)
        return true;
    who.word0 = 0;
    who.word8 = ~0ull;
    return false;
}

wxString STICKET_READ::Decode(char const* value) const { return comgui::detail::Decode(Slots(), value); }

// The plain element types: jumps into the templates.
#define COMGUI_READS(T)                                                                                      \
    bool STICKET_READ::GetVectorParameter(char const* key, std::vector<T>& out) const                        \
    {                                                                                                        \
        return xGetVectorParameter(*Access(), key, out);                                                     \
    }                                                                                                        \
    bool STICKET_READ::GetArrayParameter(char const* key, std::add_pointer_t<T> out, unsigned long count)    \
        const                                                                                                \
    {                                                                                                        \
        return xGetArrayParameter(*Access(), key, out, count);                                               \
    }
COMGUI_READS(void*)
COMGUI_READS(int)
COMGUI_READS(unsigned int)
COMGUI_READS(long long)
COMGUI_READS(unsigned long long)
COMGUI_READS(double)

bool STICKET_READ::GetVectorParameter(char const* key, std::vector<bool>& out) const
{
    return comgui::detail::ReadBools(Slots(), key, out);
}

bool STICKET_READ::GetVectorParameter(char const* key, std::vector<wxString>& out) const
{
    return comgui::detail::ReadTexts(Slots(), key, out);
}

bool STICKET_READ::GetArrayParameter(char const* key, bool* out, unsigned long count) const
{
    return comgui::detail::ReadBoolArray(Slots(), key, out, count);
}

bool STICKET_READ::GetWxArrayParameter(char const* key, wxArrayString& out) const
{
    return comgui::detail::ReadWxArray(Slots(), key, out);
}

bool STICKET_READ::GetWxArrayParameter(char const* key, wxArrayInt& out) const
{
    return comgui::detail::ReadWxArray(Slots(), key, out);
}

bool STICKET_READ::GetWxVariantParameterChk(char const* key, wxVariant& value, int pos) const
{
    return comgui::detail::ReadVariant(Slots(), key, value, pos);
}

wxVariant STICKET_READ::GetWxVariantParameterDef(wxVariant const& def, int pos) const
{
    return comgui::detail::ReadVariantLike(Slots(), def, pos);
}
