// Typed reads of the tickets in a container. A view: an MTICKET_ACCESS pointer is one. type and id name the
// ticket and go to the slot as they are; all else is as in STICKET_READ.h.
#pragma once

#include "comgui/access/TICKET_SLOTS.h"
#include "comgui/access/TICKET_VIEW.h"
#include "comgui/foundation/export.h"
#include "comgui/ticket/MTICKET_ACCESS.h"
#include <vector>
#include <wx/arrstr.h>
#include <wx/dynarray.h>
#include <wx/string.h>
#include <wx/variant.h>

class MTICKET_READ : public comgui::detail::TICKET_VIEW<MTICKET_READ, MTICKET_ACCESS>
{
public:
    int GetIntParameter(int type, int id, char const* key, int def) const
    {
        return GetIntParameter(type, id, -1, key, def);
    }
    int GetIntParameter(int type, int id, int pos, char const* key, int def) const
    {
        return comgui::detail::Read(Slots(type, id), PARAM_INT, pos, key, def);
    }

    double GetDoubleParameter(int type, int id, char const* key, double def) const
    {
        return GetDoubleParameter(type, id, -1, key, def);
    }
    double GetDoubleParameter(int type, int id, int pos, char const* key, double def) const
    {
        return comgui::detail::Read(Slots(type, id), PARAM_DOUBLE, pos, key, def);
    }

    bool GetBoolParameter(int type, int id, int pos, char const* key, bool def) const
    {
        return comgui::detail::ReadBool(Slots(type, id), pos, key, def);
    }

    void* GetVoidParameter(int type, int id, int pos, char const* key, void* def) const
    {
        return comgui::detail::Read(Slots(type, id), PARAM_POINTER, pos, key, def);
    }

    COMGUI_EXPORT bool GetParameter(int type, int id, char const* key, wxString& value, int pos) const;

    wxString GetWxStringParameter(int type, int id, int pos, char const* key, wxString const& def) const
    {
        wxString value;
        return GetParameter(type, id, key, value, pos) ? value : def;
    }

    int ParameterType(int type, int id, char const* key, int pos) const
    {
        return comgui::detail::ReadType(Slots(type, id), key, pos);
    }

    // As STICKET_READ::Decode, with the translator of the container.
    COMGUI_EXPORT wxString Decode(char const* value) const;

    // The ticket's own table, owned by the module and given back with MTICKET_ADMIN::CloseTicket; null if it
    // cannot be opened.
    STICKET_ACCESS const* OpenTicket(int type, int id) const
    {
        STICKET_ACCESS const* ticket = nullptr;
        return Access()->MOPERATION(Access()->Instance, type, id, MTICKET_OP_OPEN, &ticket) ? ticket
                                                                                            : nullptr;
    }

    // Puts the ids of that type's tickets into ids, and nothing else, in the module's order; false if there
    // are none, or the type is not one.
    COMGUI_EXPORT bool GetTickets(int type, std::vector<int>& ids) const;

    // Shows the tickets of that type to fn, one by one in the module's order, until it returns false. The
    // slot's result.
    int WalkTickets(MWALKTICKETS_ACTION fn, void* user, int type) const
    {
        return Access()->MWALKTICKETS(Access()->Instance, fn, user, type);
    }

    COMGUI_EXPORT bool GetVectorParameter(int type, int id, char const* key, std::vector<void*>& out) const;
    COMGUI_EXPORT bool GetVectorParameter(int type, int id, char const* key, std::vector<int>& out) const;
    COMGUI_EXPORT bool GetVectorParameter(int type, int id, char const* key,
                                          std::vector<unsigned int>& out) const;
    COMGUI_EXPORT bool GetVectorParameter(int type, int id, char const* key,
                                          std::vector<long long>& out) const;
    COMGUI_EXPORT bool GetVectorParameter(int type, int id, char const* key,
                                          std::vector<unsigned long long>& out) const;
    COMGUI_EXPORT bool GetVectorParameter(int type, int id, char const* key, std::vector<double>& out) const;
    COMGUI_EXPORT bool GetVectorParameter(int type, int id, char const* key, std::vector<bool>& out) const;
    COMGUI_EXPORT bool GetVectorParameter(int type, int id, char const* key,
                                          std::vector<wxString>& out) const;

    COMGUI_EXPORT bool GetArrayParameter(int type, int id, char const* key, void** out,
                                         unsigned long count) const;
    COMGUI_EXPORT bool GetArrayParameter(int type, int id, char const* key, int* out,
                                         unsigned long count) const;
    COMGUI_EXPORT bool GetArrayParameter(int type, int id, char const* key, unsigned int* out,
                                         unsigned long count) const;
    COMGUI_EXPORT bool GetArrayParameter(int type, int id, char const* key, long long* out,
                                         unsigned long count) const;
    COMGUI_EXPORT bool GetArrayParameter(int type, int id, char const* key, unsigned long long* out,
                                         unsigned long count) const;
    COMGUI_EXPORT bool GetArrayParameter(int type, int id, char const* key, double* out,
                                         unsigned long count) const;
    COMGUI_EXPORT bool GetArrayParameter(int type, int id, char const* key, bool* out,
                                         unsigned long count) const;

    COMGUI_EXPORT bool GetWxArrayParameter(int type, int id, char const* key, wxArrayString& out) const;
    COMGUI_EXPORT bool GetWxArrayParameter(int type, int id, char const* key, wxArrayInt& out) const;

    COMGUI_EXPORT bool GetWxVariantParameterChk(int type, int id, char const* key, wxVariant& value,
                                                int pos) const;
    COMGUI_EXPORT wxVariant GetWxVariantParameterDef(int type, int id, wxVariant const& def, int pos) const;

private:
    comgui::detail::MTICKET_SLOTS Slots(int type, int id) const { return {Access(), type, id}; }
};
