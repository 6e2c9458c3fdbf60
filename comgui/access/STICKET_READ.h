// Typed reads of one ticket. A view: a STICKET_ACCESS pointer is one, and nothing is kept between calls, so
// it may be used from any thread that may call the ticket's slots.
//
// key is UTF-8 and not null. pos: -1 the key as a whole, or its single value; 0 and up one value of a list;
// forms without it pass -1. The default comes back whenever the slot fails, be it for the key, the position
// or the type: views cannot tell these apart, and convert nothing.
#pragma once

#include "comgui/access/TICKET_SLOTS.h"
#include "comgui/access/TICKET_VIEW.h"
#include "comgui/foundation/export.h"
#include "comgui/ticket/STICKET_ACCESS.h"
#include <string>
#include <vector>
#include <wx/arrstr.h>
#include <wx/dynarray.h>
#include <wx/string.h>
#include <wx/variant.h>

class STICKET_READ : public comgui::detail::TICKET_VIEW<STICKET_READ, STICKET_ACCESS>
{
public:
    int GetIntParameter(char const* key, int def) const { return GetIntParameter(-1, key, def); }
    int GetIntParameter(int pos, char const* key, int def) const
    {
        return comgui::detail::Read(Slots(), PARAM_INT, pos, key, def);
    }

    double GetDoubleParameter(char const* key, double def) const { return GetDoubleParameter(-1, key, def); }
    double GetDoubleParameter(int pos, char const* key, double def) const
    {
        return comgui::detail::Read(Slots(), PARAM_DOUBLE, pos, key, def);
    }

    // An int that is not 0.
    bool GetBoolParameter(int pos, char const* key, bool def) const
    {
        return comgui::detail::ReadBool(Slots(), pos, key, def);
    }

    void* GetVoidParameter(int pos, char const* key, void* def) const
    {
        return comgui::detail::Read(Slots(), PARAM_POINTER, pos, key, def);
    }

    // The stored bytes, UTF-8; a path in variable form stays as it is.
    std::string GetStringParameter(char const* key, std::string const& def) const
    {
        char const* text = nullptr;
        if (!Slots().Get(key, PARAM_STRING, &text, -1))
            return def;
        return text ? text : "";
    }

    // A text with its folder variable resolved. A failed read empties value and gives false.
    COMGUI_EXPORT bool GetParameter(char const* key, wxString& value, int pos) const;

    // The same; the default is handed back as it is, never resolved.
    wxString GetWxStringParameter(int pos, char const* key, wxString const& def) const
    {
        wxString value;
        return GetParameter(key, value, pos) ? value : def;
    }

    // A PARAM_TYPE: at -1 PARAM_COUNT for a list, else the value's own type. 0 where nothing is stored.
    int ParameterType(char const* key, int pos) const { return comgui::detail::ReadType(Slots(), key, pos); }

    // How many values the key holds; 0 if there is no such key.
    unsigned long GetVectorSize(char const* key) const { return comgui::detail::ReadCount(Slots(), key); }

    // Asks the module who this ticket is. On failure the words of who become 0 and all ones.
    COMGUI_EXPORT bool WhoAmI(STICKET_OPTION_WHOAMI& who) const;

    // A text as GetParameter gives it: UTF-8, folder variable resolved, null the empty text.
    COMGUI_EXPORT wxString Decode(char const* value) const;

    // All values of the key, with two calls of the module. What cannot be read is left out, and what stands
    // behind it moves up; false if that leaves nothing. If there is no such key out stays as it was; so it
    // does, for bools and texts, if nothing can be read. bools are ints that are not 0; texts are as
    // GetParameter gives them, null ones left out. list_templates.h says more.
    COMGUI_EXPORT bool GetVectorParameter(char const* key, std::vector<void*>& out) const;
    COMGUI_EXPORT bool GetVectorParameter(char const* key, std::vector<int>& out) const;
    COMGUI_EXPORT bool GetVectorParameter(char const* key, std::vector<unsigned int>& out) const;
    COMGUI_EXPORT bool GetVectorParameter(char const* key, std::vector<long long>& out) const;
    COMGUI_EXPORT bool GetVectorParameter(char const* key, std::vector<unsigned long long>& out) const;
    COMGUI_EXPORT bool GetVectorParameter(char const* key, std::vector<double>& out) const;
    COMGUI_EXPORT bool GetVectorParameter(char const* key, std::vector<bool>& out) const;
    COMGUI_EXPORT bool GetVectorParameter(char const* key, std::vector<wxString>& out) const;

    // The first count values, to where out points. True if all of them could be read; if not, the places of
    // those that could not are as they were, and for bools all places. False for a count of 0.
    COMGUI_EXPORT bool GetArrayParameter(char const* key, void** out, unsigned long count) const;
    COMGUI_EXPORT bool GetArrayParameter(char const* key, int* out, unsigned long count) const;
    COMGUI_EXPORT bool GetArrayParameter(char const* key, unsigned int* out, unsigned long count) const;
    COMGUI_EXPORT bool GetArrayParameter(char const* key, long long* out, unsigned long count) const;
    COMGUI_EXPORT bool GetArrayParameter(char const* key, unsigned long long* out, unsigned long count) const;
    COMGUI_EXPORT bool GetArrayParameter(char const* key, double* out, unsigned long count) const;
    COMGUI_EXPORT bool GetArrayParameter(char const* key, bool* out, unsigned long count) const;

    // As the vectors; texts go behind those that out holds, ints come instead of those.
    COMGUI_EXPORT bool GetWxArrayParameter(char const* key, wxArrayString& out) const;
    COMGUI_EXPORT bool GetWxArrayParameter(char const* key, wxArrayInt& out) const;

    // A value as a variant of the ticket's choosing, named by the key: "void*", "long", "double" or "string";
    // of a list as a whole an "arrstring" of its texts, or a "list" if it holds anything else, up to the
    // first value that cannot be read. False, with a null variant of that name, for all other types and if
    // there is no value.
    COMGUI_EXPORT bool GetWxVariantParameterChk(char const* key, wxVariant& value, int pos) const;

    // The value whose key is the name of def, as a variant of def's type and name; def is the default as
    // well. "bool", "double", "long" (of an int), "string", "void*", and at -1 "list" and "arrstring",
    // element by element and as long as def's. Anything else gives def. The key is the name in the local
    // encoding.
    COMGUI_EXPORT wxVariant GetWxVariantParameterDef(wxVariant const& def, int pos) const;

private:
    comgui::detail::STICKET_SLOTS Slots() const { return {Access()}; }
};
