#include "comgui/access/MTICKET_READ.h"

#include "comgui/access/decode.h"
#include "comgui/access/list_conversions.h"
#include "comgui/access/list_templates.h"
#include "comgui/access/variant_bridge.h"
#include <type_traits>

bool MTICKET_READ::GetParameter(int type, int id, char const* key, wxString& value, int pos) const
{
    return comgui::detail::ReadText(Slots(type, id), key, value, pos);
}

wxString MTICKET_READ::Decode(char const* value) const
{
    return comgui::detail::Decode(Slots(TICKET_ID_NONE, TICKET_ID_NONE), value);
}

// True: a listing wants all of them.
static bool WalkGetTickets(void* user, int, int id, STICKET_ACCESS const*)
{
    static_cast<std::vector<int>*>(user)->push_back(id);
    return true;
}

bool MTICKET_READ::GetTickets(int type, std::vector<int>& ids) const
{
    ids.clear();
    if (TICKET_TYPE_Valid(type))
        WalkTickets(WalkGetTickets, &ids, type);
    return !ids.empty();
}

// The plain element types: jumps into the templates.
#define COMGUI_READS(T)                                                                                      \
    bool MTICKET_READ::GetVectorParameter(int type, int id, char const* key, std::vector<T>& out) const      \
    {                                                                                                        \
        return xGetVectorParameter(*Access(), type, id, key, out);                                           \
    }                                                                                                        \
    bool MTICKET_READ::GetArrayParameter(int type, int id, char const* key, std::add_pointer_t<T> out,       \
                                         unsigned long count) const                                          \
    {                                                                                                        \
        return xGetArrayParameter(*Access(), type, id, key, out, count);                                     \
    }
COMGUI_READS(void*)
COMGUI_READS(int)
COMGUI_READS(unsigned int)
COMGUI_READS(long long)
COMGUI_READS(unsigned long long)
COMGUI_READS(double)

bool MTICKET_READ::GetVectorParameter(int type, int id, char const* key, std::vector<bool>& out) const
{
    return comgui::detail::ReadBools(Slots(type, id), key, out);
}

bool MTICKET_READ::GetVectorParameter(int type, int id, char const* key, std::vector<wxString>& out) const
{
    return comgui::detail::ReadTexts(Slots(type, id), key, out);
}

bool MTICKET_READ::GetArrayParameter(int type, int id, char const* key, bool* out, unsigned long count) const
{
    return comgui::detail::ReadBoolArray(Slots(type, id), key, out, count);
}

bool MTICKET_READ::GetWxArrayParameter(int type, int id, char const* key, wxArrayString& out) const
{
    return comgui::detail::ReadWxArray(Slots(type, id), key, out);
}

bool MTICKET_READ::GetWxArrayParameter(int type, int id, char const* key, wxArrayInt& out) const
{
    return comgui::detail::ReadWxArray(Slots(type, id), key, out);
}

bool MTICKET_READ::GetWxVariantParameterChk(int type, int id, char const* key, wxVariant& value,
                                            int pos) const
{
    return comgui::detail::ReadVariant(Slots(type, id), key, value, pos);
}

wxVariant MTICKET_READ::GetWxVariantParameterDef(int type, int id, wxVariant const& def, int pos) const
{
    return comgui::detail::ReadVariantLike(Slots(type, id), def, pos);
}
