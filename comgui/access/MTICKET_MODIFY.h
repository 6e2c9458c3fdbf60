// Typed writes of the tickets in a container. A view: an MTICKET_ACCESS pointer is one. type and id name the
// ticket and go to the slot as they are; all else is as in STICKET_MODIFY.h. There is no form for an int and
// none for a table: whoever needs them opens the ticket.
#pragma once

#include "comgui/access/TICKET_SLOTS.h"
#include "comgui/access/TICKET_VIEW.h"
#include "comgui/foundation/export.h"
#include "comgui/ticket/MTICKET_ACCESS.h"
#include <type_traits>
#include <vector>
#include <wx/arrstr.h>
#include <wx/dynarray.h>
#include <wx/string.h>
#include <wx/variant.h>

class MTICKET_MODIFY : public comgui::detail::TICKET_VIEW<MTICKET_MODIFY, MTICKET_ACCESS>
{
public:
    int SetParameter(int type, int id, char const* key, bool value, int pos) const
    {
        return comgui::detail::Write(Slots(type, id), key, PARAM_INT, value ? 1 : 0, pos);
    }

    int SetParameter(int type, int id, char const* key, double value, int pos) const
    {
        return comgui::detail::Write(Slots(type, id), key, PARAM_DOUBLE, value, pos);
    }

    int SetParameter(int type, int id, char const* key, void* value, int pos) const
    {
        return Slots(type, id).Set(key, PARAM_POINTER, value, pos);
    }

    int SetParameter(int type, int id, char const* key, wxString const& value, int pos) const
    {
        return Slots(type, id).Set(key, PARAM_STRING, value.utf8_str(), pos);
    }

    template <typename Char, std::enable_if_t<std::is_same_v<Char, char>, int> = 0>
    int SetParameter(int type, int id, char const* key, Char const* value, int pos) const
    {
        return Slots(type, id).Set(key, PARAM_STRING, value, pos);
    }
    template <typename Char, std::enable_if_t<std::is_same_v<Char, wchar_t>, int> = 0>
    int SetParameter(int type, int id, char const* key, Char const* value, int pos) const
    {
        return SetParameter(type, id, key, wxString(value), pos);
    }

    int DelParameter(int type, int id, char const* key, int pos) const
    {
        return Slots(type, id).Set(key, PARAM_NONE, nullptr, pos);
    }

    // Makes it a partial ticket of the keys in that null-ended table, which goes to the slot itself.
    int SetPartial(int type, int id, char const* const* keys) const
    {
        return Access()->MOPERATION(Access()->Instance, type, id, STICKET_OP_SET_PARTIAL,
                                    const_cast<char const**>(keys));
    }

    COMGUI_EXPORT bool SetVectorParameter(int type, int id, char const* key,
                                          std::vector<void*> const& in) const;
    COMGUI_EXPORT bool SetVectorParameter(int type, int id, char const* key,
                                          std::vector<int> const& in) const;
    COMGUI_EXPORT bool SetVectorParameter(int type, int id, char const* key,
                                          std::vector<unsigned int> const& in) const;
    COMGUI_EXPORT bool SetVectorParameter(int type, int id, char const* key,
                                          std::vector<long long> const& in) const;
    COMGUI_EXPORT bool SetVectorParameter(int type, int id, char const* key,
                                          std::vector<unsigned long long> const& in) const;
    COMGUI_EXPORT bool SetVectorParameter(int type, int id, char const* key,
                                          std::vector<double> const& in) const;
    COMGUI_EXPORT bool SetVectorParameter(int type, int id, char const* key,
                                          std::vector<bool> const& in) const;
    COMGUI_EXPORT bool SetVectorParameter(int type, int id, char const* key,
                                          std::vector<wxString> const& in) const;

    COMGUI_EXPORT bool SetArrayParameter(int type, int id, char const* key, void* const* in,
                                         unsigned long count) const;
    COMGUI_EXPORT bool SetArrayParameter(int type, int id, char const* key, int const* in,
                                         unsigned long count) const;
    COMGUI_EXPORT bool SetArrayParameter(int type, int id, char const* key, unsigned int const* in,
                                         unsigned long count) const;
    COMGUI_EXPORT bool SetArrayParameter(int type, int id, char const* key, long long const* in,
                                         unsigned long count) const;
    COMGUI_EXPORT bool SetArrayParameter(int type, int id, char const* key, unsigned long long const* in,
                                         unsigned long count) const;
    COMGUI_EXPORT bool SetArrayParameter(int type, int id, char const* key, double const* in,
                                         unsigned long count) const;
    COMGUI_EXPORT bool SetArrayParameter(int type, int id, char const* key, bool const* in,
                                         unsigned long count) const;

    // The texts stand behind as many empty ones: a list of twice the size, which no other call writes.
    COMGUI_EXPORT bool SetWxArrayParameter(int type, int id, char const* key, wxArrayString const& in) const;
    COMGUI_EXPORT bool SetWxArrayParameter(int type, int id, char const* key, wxArrayInt const& in) const;

    COMGUI_EXPORT bool SetWxVariantParameter(int type, int id, char const* key, wxVariant const& value,
                                             int pos) const;

private:
    comgui::detail::MTICKET_SLOTS Slots(int type, int id) const { return {Access(), type, id}; }
};
