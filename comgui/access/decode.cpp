#include "comgui/access/decode.h"

namespace comgui::detail
{
bool IsDecodeNeeded(std::string const& text) { return text.size() >= 4 && text[0] == '$' && text[1] == '('; }

template <typename Slots>
wxString Decode(Slots const& slots, char const* value)
{
    if (!value)
        return wxString();
    std::string text = value;
    if (IsDecodeNeeded(text))
        if (clFOLDER_VARIABLES const* const folders = slots.GetFolderVariables())
            text = folders->Decode(text, false);
    return wxString::FromUTF8(text.c_str(), wxString::npos);
}

template <typename Slots>
bool ReadText(Slots const& slots, char const* key, wxString& value, int pos)
{
    char const* text = nullptr;
    if (!slots.Get(key, PARAM_STRING, &text, pos))
    {
        value.clear();  // what a caller overlooks must not look like a value of this ticket
        return false;
    }
    value = Decode(slots, text);
    return true;
}

template wxString Decode(STICKET_SLOTS const&, char const*);
template wxString Decode(MTICKET_SLOTS const&, char const*);
template bool ReadText(STICKET_SLOTS const&, char const*, wxString&, int);
template bool ReadText(MTICKET_SLOTS const&, char const*, wxString&, int);
}  // namespace comgui::detail
