#include "comgui/access/variant_bridge.h"

#include "comgui/access/decode.h"
#include "comgui/access/list_conversions.h"
#include <memory>
#include <typeinfo>
#include <wx/arrstr.h>
#include <wx/string.h>

namespace comgui::detail
{
namespace
{
enum class KIND
{
    BOOL,
    DOUBLE,
    LIST,
    LONG,
    STRING,
    ARRSTRING,
    POINTER,
    OTHER,
};

// The class of what the variant holds; null if it holds nothing.
std::type_info const* ClassOf(wxVariant const& variant)
{
    wxVariantData const* const data = variant.GetData();
    return data ? &typeid(*data) : nullptr;
}

KIND KindOf(wxVariant const& variant)
{
    static wchar_t const* const names[] = {L"bool",   L"double",    L"list", L"long",
                                           L"string", L"arrstring", L"void*"};
    // Most values are texts. The name of a type is a text that has to be made, a class is just there.
    static std::type_info const* const classOfTexts = ClassOf(wxVariant(wxString()));
    std::type_info const* const itsClass = ClassOf(variant);
    if (itsClass && *itsClass == *classOfTexts)
        return KIND::STRING;
    wxString const type = variant.GetType();
    int kind = 0;
    while (kind < static_cast<int>(KIND::OTHER) && type != names[kind])
        ++kind;
    return static_cast<KIND>(kind);
}

// The default is made only if there is no text.
template <typename Slots, typename MakeDefault>
wxString ReadTextOr(Slots const& ticket, int pos, char const* key, MakeDefault makeDefault)
{
    wxString text;
    if (!ReadText(ticket, key, text, pos))
        makeDefault().swap(text);
    return text;
}

// Whether the key holds nothing but texts, or nothing at all.
template <typename Slots>
bool HoldsTexts(Slots const& ticket, char const* key)
{
    int pos = 0;
    int type = 0;
    while ((type = ReadType(ticket, key, pos)) == PARAM_STRING)
        ++pos;
    return type == PARAM_NONE;
}

// The values of a key up to the first that cannot be read.
template <typename Slots>
wxVariant ReadVariants(Slots const& ticket, char const* key)
{
    wxVariant list;
    list.NullList();
    wxVariant element;
    for (int pos = 0; ReadVariant(ticket, key, element, pos); ++pos)
        list.Append(element);
    return list;
}

template <typename Slots>
wxVariant ReadVector(Slots const& ticket, char const* key)
{
    if (!HoldsTexts(ticket, key))
        return ReadVariants(ticket, key);
    wxArrayString texts;
    ReadWxArray(ticket, key, texts);
    return texts;
}

// What the ticket holds there as it is; null for what has no form as a variant.
template <typename Slots>
wxVariant ReadStored(Slots const& ticket, char const* key, int pos)
{
    switch (ReadType(ticket, key, pos))
    {
    case PARAM_POINTER:
        return Read<void*>(ticket, PARAM_POINTER, pos, key, nullptr);
    case PARAM_INT:
        return static_cast<long>(Read(ticket, PARAM_INT, pos, key, 0));
    case PARAM_DOUBLE:
        return Read(ticket, PARAM_DOUBLE, pos, key, 0.0);
    case PARAM_STRING:
        return ReadTextOr(ticket, pos, key, [] { return wxString(); });
    case PARAM_COUNT:
        return pos == -1 ? ReadVector(ticket, key) : wxVariant();
    default:
        return wxVariant();
    }
}

template <typename Slots>
wxVariant ReadAs(Slots const& ticket, char const* key, wxVariant const& def, int pos);

// A list names its elements, whatever they were called in def.
template <typename Slots>
wxVariant ReadListLike(Slots const& ticket, char const* key, wxVariant const& def)
{
    wxVariant list;
    list.NullList();
    int pos = 0;
    for (wxVariant const* const element : def.GetList())
    {
        auto value = std::make_unique<wxVariant>(ReadAs(ticket, key, *element, pos++));
        value->SetName(def.GetName());
        list.GetList().Append(value.get());
        static_cast<void>(value.release());  // the list's from here on
    }
    return list;
}

template <typename Slots>
wxVariant ReadTextsLike(Slots const& ticket, char const* key, wxVariant const& def)
{
    wxArrayString texts = def.GetArrayString();
    for (std::size_t i = 0; i < texts.size(); ++i)
        ReadTextOr(ticket, static_cast<int>(i), key, [&] { return texts[i]; }).swap(texts[i]);
    return texts;
}

template <typename Slots>
wxVariant ReadAs(Slots const& ticket, char const* key, wxVariant const& def, int pos)
{
    switch (KindOf(def))
    {
    case KIND::BOOL:
        return ReadBool(ticket, pos, key, def.GetBool());
    case KIND::DOUBLE:
        return Read(ticket, PARAM_DOUBLE, pos, key, def.GetDouble());
    case KIND::LIST:
        return pos == -1 ? ReadListLike(ticket, key, def) : def;
    case KIND::LONG:
        return static_cast<long>(Read(ticket, PARAM_INT, pos, key, static_cast<int>(def.GetLong())));
    case KIND::STRING:
        return ReadTextOr(ticket, pos, key, [&] { return def.GetString(); });
    case KIND::ARRSTRING:
        return pos == -1 ? ReadTextsLike(ticket, key, def) : def;
    case KIND::POINTER:
        return Read(ticket, PARAM_POINTER, pos, key, def.GetVoidPtr());
    case KIND::OTHER:
        break;
    }
    return def;
}

// Value by value, so that the kinds may differ; the first at -1, where it replaces all that was there.
template <typename Slots>
void WriteVariants(Slots const& ticket, char const* key, wxVariant const& list)
{
    int pos = 0;
    for (wxVariant const* const element : list.GetList())
    {
        WriteVariant(ticket, key, *element, pos == 0 ? -1 : pos);
        ++pos;
    }
}
}  // namespace

template <typename Slots>
bool ReadVariant(Slots const& ticket, char const* key, wxVariant& value, int pos)
{
    wxString const name(key, wxConvUTF8);  // first, as key may be a conversion of the name that value has
    value = ReadStored(ticket, key, pos);
    value.SetName(name);
    return !value.IsNull();
}

template <typename Slots>
wxVariant ReadVariantLike(Slots const& ticket, wxVariant const& def, int pos)
{
    // Looks like a mistake beside the UTF-8 of ReadVariant, but is required: the local encoding.
    wxString const& name = def.GetName();
    wxVariant value = ReadAs(ticket, name.mb_str(wxConvLibc), def, pos);
    value.SetName(name);
    return value;
}

template <typename Slots>
bool WriteVariant(Slots const& ticket, char const* key, wxVariant const& value, int pos)
{
    switch (KindOf(value))
    {
    case KIND::BOOL:
        return Write(ticket, key, PARAM_INT, value.GetBool() ? 1 : 0, pos) != 0;
    case KIND::DOUBLE:
        return Write(ticket, key, PARAM_DOUBLE, value.GetDouble(), pos) != 0;
    case KIND::LIST:
        if (pos == -1)
            WriteVariants(ticket, key, value);
        return pos == -1;
    case KIND::LONG:
        // Looks like a mistake, but is required: what comes back is a "double".
        return Write(ticket, key, PARAM_DOUBLE, static_cast<double>(value.GetLong()), pos) != 0;
    case KIND::STRING:
        return ticket.Set(key, PARAM_STRING, value.GetString().utf8_str(), pos) != 0;
    case KIND::ARRSTRING:
        return pos == -1 && WriteWxArray(ticket, key, value.GetArrayString());
    case KIND::POINTER:
        return ticket.Set(key, PARAM_POINTER, value.GetVoidPtr(), pos) != 0;
    case KIND::OTHER:
        break;
    }
    return false;
}

#define COMGUI_INSTANTIATE(SLOTS)                                                                            \
    template bool ReadVariant(SLOTS const&, char const*, wxVariant&, int);                                   \
    template wxVariant ReadVariantLike(SLOTS const&, wxVariant const&, int);                                 \
    template bool WriteVariant(SLOTS const&, char const*, wxVariant const&, int);
COMGUI_INSTANTIATE(STICKET_SLOTS)
COMGUI_INSTANTIATE(MTICKET_SLOTS)
}  // namespace comgui::detail
