// Typed writes of one ticket. A view: a STICKET_ACCESS pointer is one, see STICKET_READ.h for what holds of
// keys, positions and threads; and -2 as a position appends behind the last value. Results are the slot's,
// unchanged: not zero is success. A path is stored as it is given: who wants $(VARIABLE) form encodes it.
#pragma once

#include "comgui/access/TICKET_SLOTS.h"
#include "comgui/access/TICKET_VIEW.h"
#include "comgui/foundation/export.h"
#include "comgui/ticket/STICKET_ACCESS.h"
#include <type_traits>
#include <vector>
#include <wx/arrstr.h>
#include <wx/dynarray.h>
#include <wx/string.h>
#include <wx/variant.h>

class STICKET_MODIFY : public comgui::detail::TICKET_VIEW<STICKET_MODIFY, STICKET_ACCESS>
{
public:
    int SetParameter(char const* key, int value, int pos) const
    {
        return comgui::detail::Write(Slots(), key, PARAM_INT, value, pos);
    }

    // Stored as an int, 1 or 0.
    int SetParameter(char const* key, bool value, int pos) const
    {
        return comgui::detail::Write(Slots(), key, PARAM_INT, value ? 1 : 0, pos);
    }

    int SetParameter(char const* key, double value, int pos) const
    {
        return comgui::detail::Write(Slots(), key, PARAM_DOUBLE, value, pos);
    }

    int SetParameter(char const* key, void* value, int pos) const
    {
        return Slots().Set(key, PARAM_POINTER, value, pos);
    }

    // The slot gets a pointer into value, so no other thread may touch that meanwhile.
    COMGUI_EXPORT int SetParameter(char const* key, wxString const& value, int pos) const;

    // Text literals, UTF-8 or wide as wxT() makes them: without these forms they would be taken for a bool.
    template <typename Char, std::enable_if_t<std::is_same_v<Char, char>, int> = 0>
    int SetParameter(char const* key, Char const* value, int pos) const
    {
        return Slots().Set(key, PARAM_STRING, value, pos);
    }
    template <typename Char, std::enable_if_t<std::is_same_v<Char, wchar_t>, int> = 0>
    int SetParameter(char const* key, Char const* value, int pos) const
    {
        return SetParameter(key, wxString(value), pos);
    }

    // Removes one value, or at -1 the key as a whole.
    int DelParameter(char const* key, int pos) const { return Slots().Set(key, PARAM_NONE, nullptr, pos); }

    // Writes a table; each record's ok tells whether it was carried out.
    int SetMultiParameter(SETMULTIPAR* table) const
    {
        return Access()->SSETMULTIPAR(Access()->Instance, table);
    }

    // Writes a whole list in one call of the module, instead of what the key held. True if all values were
    // written; if not, those that were stay written. An empty list deletes the key, which is true whatever
    // the slot says. bools are stored as ints, 1 and 0; the slot gets pointers into the texts.
    COMGUI_EXPORT bool SetVectorParameter(char const* key, std::vector<void*> const& in) const;
    COMGUI_EXPORT bool SetVectorParameter(char const* key, std::vector<int> const& in) const;
    COMGUI_EXPORT bool SetVectorParameter(char const* key, std::vector<unsigned int> const& in) const;
    COMGUI_EXPORT bool SetVectorParameter(char const* key, std::vector<long long> const& in) const;
    COMGUI_EXPORT bool SetVectorParameter(char const* key, std::vector<unsigned long long> const& in) const;
    COMGUI_EXPORT bool SetVectorParameter(char const* key, std::vector<double> const& in) const;
    COMGUI_EXPORT bool SetVectorParameter(char const* key, std::vector<bool> const& in) const;
    COMGUI_EXPORT bool SetVectorParameter(char const* key, std::vector<wxString> const& in) const;

    // The same for count values. bools are not written: they delete the key, which is true, and a count of 0
    // leaves even that; write them with a vector.
    COMGUI_EXPORT bool SetArrayParameter(char const* key, void* const* in, unsigned long count) const;
    COMGUI_EXPORT bool SetArrayParameter(char const* key, int const* in, unsigned long count) const;
    COMGUI_EXPORT bool SetArrayParameter(char const* key, unsigned int const* in, unsigned long count) const;
    COMGUI_EXPORT bool SetArrayParameter(char const* key, long long const* in, unsigned long count) const;
    COMGUI_EXPORT bool SetArrayParameter(char const* key, unsigned long long const* in,
                                         unsigned long count) const;
    COMGUI_EXPORT bool SetArrayParameter(char const* key, double const* in, unsigned long count) const;
    COMGUI_EXPORT bool SetArrayParameter(char const* key, bool const* in, unsigned long count) const;

    COMGUI_EXPORT bool SetWxArrayParameter(char const* key, wxArrayString const& in) const;
    COMGUI_EXPORT bool SetWxArrayParameter(char const* key, wxArrayInt const& in) const;

    // Writes a variant of the types "bool" (an int), "double", "long" (as a double), "string", "void*" and,
    // at -1, "arrstring", and gives whether the slot did. A "list", at -1, is written element by element and
    // is true whatever becomes of them; an empty one leaves the key as it was. Anything else is false.
    COMGUI_EXPORT bool SetWxVariantParameter(char const* key, wxVariant const& value, int pos) const;

private:
    comgui::detail::STICKET_SLOTS Slots() const { return {Access()}; }
};
