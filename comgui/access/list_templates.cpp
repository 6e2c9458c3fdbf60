#include "comgui/access/list_templates.h"

#include "comgui/access/lists.h"
#include "comgui/ticket/MultiParameter.h"
#include <memory>
#include <type_traits>
#include <wx/dynarray.h>

namespace comgui::detail
{
namespace
{
using READ_TABLE = std::unique_ptr<GETMULTIPAR[], FREE>;
using WRITE_TABLE = std::unique_ptr<SETMULTIPAR[], FREE>;

// Whether a read makes sure of its table before it fills it in. It looks like a mistake that a vector of a
// container's ticket does not, but so it has to be: out of memory ends the process there.
template <typename Slots, typename List>
constexpr bool ChecksTable = std::is_same_v<Slots, STICKET_SLOTS> || std::is_same_v<List, wxArrayInt>;

// A vector keeps what it holds until the slot writes over it, a wxArrayInt does not.
template <typename T>
void MakeRoom(std::vector<T>& list, unsigned long count)
{
    list.resize(count);
}
void MakeRoom(wxArrayInt& list, unsigned long count)
{
    list.clear();
    list.resize(count, 0);
}

// Where a read stores an element.
template <typename T>
void* Place(T& element)
{
    return &element;
}

// The value word of an element on a write.
template <typename T>
void const* Word(T const& element)
{
    if constexpr (std::is_pointer_v<T>)
        return element;
    else
        return &element;
}

// Gives each record its value word. The count is cut to what a position can be.
template <typename Table, typename T, typename ValueWord>
void Fill(Table const& table, T* elements, unsigned long count, ValueWord word)
{
    int const size = static_cast<int>(count);
    for (int i = 0; i < size; ++i)
        table[static_cast<unsigned>(i)].value = word(elements[i]);
}

// Closes the list up over the elements that could not be read.
template <typename List>
void DropFailed(List& list, READ_TABLE const& table)
{
    std::size_t kept = 0;
    while (kept < list.size() && IsOk(table[kept]))
        ++kept;
    for (std::size_t i = kept; i < list.size(); ++i)
        if (IsOk(table[i]))
            list[kept++] = list[i];
    list.resize(kept);
}
}  // namespace

template <typename T, typename Slots, typename List>
bool ReadList(Slots const& ticket, char const* key, List& out)
{
    unsigned long const count = ReadCount(ticket, key);
    if (count == 0)
        return false;
    READ_TABLE const table(NewGetMultipar(count, key, GetParamType<T>()));
    if (ChecksTable<Slots, List> && !table)
        return false;
    MakeRoom(out, count);
    Fill(table, &out[0], count, Place<T>);
    ticket.GetTable(table.get());
    DropFailed(out, table);
    return !out.empty();
}

template <typename T, typename Slots>
bool ReadArray(Slots const& ticket, char const* key, T* out, unsigned long count)
{
    if (count == 0)
        return false;
    READ_TABLE const table(NewGetMultipar(count, key, GetParamType<T>()));
    Fill(table, out, count, Place<T>);
    ticket.GetTable(table.get());
    return AllMultiParameterOk(table.get());
}

template <typename T, typename Slots>
bool WriteList(Slots const& ticket, char const* key, T const* in, unsigned long count)
{
    if (count == 0)
    {
        ticket.Set(key, PARAM_NONE, nullptr, -1);
        return true;
    }
    WRITE_TABLE const table(NewSetMultipar(count, key, GetParamType<T>()));
    Fill(table, in, count, Word<T>);
    ticket.SetTable(table.get());
    return AllMultiParameterOk(table.get());
}

// What else the library calls.
#define COMGUI_INSTANTIATE(SLOTS)                                                                            \
    template bool ReadList<int>(SLOTS const&, char const*, std::vector<int>&);                               \
    template bool ReadList<int>(SLOTS const&, char const*, wxArrayInt&);                                     \
    template bool ReadList<char const*>(SLOTS const&, char const*, std::vector<char const*>&);               \
    template bool ReadArray<int>(SLOTS const&, char const*, int*, unsigned long);                            \
    template bool WriteList<int>(SLOTS const&, char const*, int const*, unsigned long);                      \
    template bool WriteList<char const*>(SLOTS const&, char const*, char const* const*, unsigned long);
COMGUI_INSTANTIATE(STICKET_SLOTS)
COMGUI_INSTANTIATE(MTICKET_SLOTS)
}  // namespace comgui::detail

using comgui::detail::MTICKET_SLOTS;
using comgui::detail::ReadArray;
using comgui::detail::ReadList;
using comgui::detail::STICKET_SLOTS;
using comgui::detail::WriteList;

template <typename T>
bool xGetVectorParameter(STICKET_ACCESS const& access, char const* key, std::vector<T>& out)
{
    return ReadList<T>(STICKET_SLOTS{&access}, key, out);
}

template <typename T>
bool xGetVectorParameter(MTICKET_ACCESS const& access, int type, int id, char const* key, std::vector<T>& out)
{
    return ReadList<T>(MTICKET_SLOTS{&access, type, id}, key, out);
}

template <typename T>
bool xGetArrayParameter(STICKET_ACCESS const& access, char const* key, T* out, unsigned long count)
{
    return ReadArray(STICKET_SLOTS{&access}, key, out, count);
}

template <typename T>
bool xGetArrayParameter(MTICKET_ACCESS const& access, int type, int id, char const* key, T* out,
                        unsigned long count)
{
    return ReadArray(MTICKET_SLOTS{&access, type, id}, key, out, count);
}

template <typename T>
bool xSetVectorParameter(STICKET_ACCESS const& access, char const* key, std::vector<T> const& in)
{
    return WriteList(STICKET_SLOTS{&access}, key, in.data(), in.size());
}

template <typename T>
bool xSetVectorParameter(MTICKET_ACCESS const& access, int type, int id, char const* key,
                         std::vector<T> const& in)
{
    return WriteList(MTICKET_SLOTS{&access, type, id}, key, in.data(), in.size());
}

template <typename T>
bool xSetArrayParameter(STICKET_ACCESS const& access, char const* key, T const* in, unsigned long count)
{
    return WriteList(STICKET_SLOTS{&access}, key, in, count);
}

template <typename T>
bool xSetArrayParameter(MTICKET_ACCESS const& access, int type, int id, char const* key, T const* in,
                        unsigned long count)
{
    return WriteList(MTICKET_SLOTS{&access, type, id}, key, in, count);
}

template <typename T>
bool xpSetVectorParameter(STICKET_ACCESS const& access, char const* key, std::vector<T> const& in)
{
    return WriteList(STICKET_SLOTS{&access}, key, in.data(), in.size());
}

template <typename T>
bool xpSetVectorParameter(MTICKET_ACCESS const& access, int type, int id, char const* key,
                          std::vector<T> const& in)
{
    return WriteList(MTICKET_SLOTS{&access, type, id}, key, in.data(), in.size());
}

template <typename T>
bool xpSetArrayParameter(STICKET_ACCESS const& access, char const* key, T const* in, unsigned long count)
{
    return WriteList(STICKET_SLOTS{&access}, key, in, count);
}

template <typename T>
bool xpSetArrayParameter(MTICKET_ACCESS const& access, int type, int id, char const* key, T const* in,
                         unsigned long count)
{
    return WriteList(MTICKET_SLOTS{&access, type, id}, key, in, count);
}

// A template of lists for one element type, in both its forms.
#define COMGUI_BOTH_FORMS(NAME, ...)                                                                         \
    template bool NAME(STICKET_ACCESS const&, char const*, __VA_ARGS__);                                     \
    template bool NAME(MTICKET_ACCESS const&, int, int, char const*, __VA_ARGS__);

#define COMGUI_READS(T)                                                                                      \
    COMGUI_BOTH_FORMS(xGetVectorParameter, std::vector<T>&)                                                  \
    COMGUI_BOTH_FORMS(xGetArrayParameter, std::add_pointer_t<T>, unsigned long)
COMGUI_READS(void*)
COMGUI_READS(int)
COMGUI_READS(unsigned int)
COMGUI_READS(long long)
COMGUI_READS(unsigned long long)
COMGUI_READS(double)
COMGUI_BOTH_FORMS(xGetVectorParameter, std::vector<char const*>&)

#define COMGUI_WRITES(T)                                                                                     \
    COMGUI_BOTH_FORMS(xSetVectorParameter, std::vector<T> const&)                                            \
    COMGUI_BOTH_FORMS(xSetArrayParameter, T const*, unsigned long)
COMGUI_WRITES(int)
COMGUI_WRITES(unsigned int)
COMGUI_WRITES(long long)
COMGUI_WRITES(unsigned long long)
COMGUI_WRITES(double)
COMGUI_BOTH_FORMS(xpSetVectorParameter, std::vector<void*> const&)
COMGUI_BOTH_FORMS(xpSetVectorParameter, std::vector<char const*> const&)
COMGUI_BOTH_FORMS(xpSetArrayParameter, void* const*, unsigned long)
