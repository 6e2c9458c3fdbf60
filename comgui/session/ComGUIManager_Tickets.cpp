// From the session to a slot of a container, with nothing between but a test or two. Which tests differs from
// one operation to the next, and hosts rely on each as it is.
#include "comgui/session/ComGUIManager.h"

#include "comgui/access/FromUtf8.h"
#include "comgui/ticket/TICKET_ID.h"

namespace
{
// A count is read into 64 bits, since so many are written, and its low 32 bits count.

constexpr int Refused = -1;  // not logged in, or no container

// Reads the values under a key one by one. get(ptype, value, pos) is a GetParameter with everything else
// filled in. Its answers are not looked at: what a failed read leaves in place counts.
template <typename Array, typename Element, typename Get, typename Convert>
Array ReadArray(PARAM_TYPE ptype, Element element, Get get, Convert convert)
{
    Array result;
    long long word = -1;
    get(PARAM_COUNT, &word, -1);
    int const count = static_cast<int>(word);
    for (int pos = 0; pos < count; ++pos)
    {
        get(ptype, &element, pos);
        result.Add(convert(element));
    }
    return result;
}

template <typename Get>
wxArrayInt ReadIntArray(Get get)
{
    return ReadArray<wxArrayInt>(PARAM_INT, 0, get, [](int value) { return value; });
}

template <typename Get>
wxArrayString ReadStringArray(Get get)
{
    return ReadArray<wxArrayString>(PARAM_STRING, static_cast<char const*>(nullptr), get,
                                    comgui::detail::FromUtf8);
}

auto ReaderOf(ComGUIManager& manager, MTICKET_ACCESS const* container, int type, int id, char const* key)
{
    return [&manager, container, type, id, key](PARAM_TYPE ptype, void* value, int pos)
    { return manager.GetParameter(container, type, id, key, ptype, value, pos); };
}
}  // namespace

int ComGUIManager::GetParameter(int type, int id, char const* key, PARAM_TYPE ptype, void* value, int pos)
{
    if (!m_bLoggedIn)
        return Refused;
    return m_pClientContainer->MGETPARAMETER(m_pClientContainer->Instance, type, id, key, ptype, value, pos);
}

int ComGUIManager::GetParameter(MTICKET_ACCESS const* container, int type, int id, char const* key,
                                PARAM_TYPE ptype, void* value, int pos)
{
    if (!m_bLoggedIn || !container)
        return Refused;
    return container->MGETPARAMETER(container->Instance, type, id, key, ptype, value, pos);
}

int ComGUIManager::SetParameter(int type, int id, char const* key, PARAM_TYPE ptype, void const* value,
                                int pos)
{
    return SetParameter(m_pClientContainer, type, id, key, ptype, value, pos);
}

int ComGUIManager::SetParameter(MTICKET_ACCESS const* container, int type, int id, char const* key,
                                PARAM_TYPE ptype, void const* value, int pos)
{
    if (!m_bLoggedIn)
        return Refused;
    return container->MSETPARAMETER(container->Instance, type, id, key, ptype, value, pos);
}

int ComGUIManager::GetSystemTicketParamForKey(char const* key, PARAM_TYPE ptype, void* value, int pos)
{
    return GetSystemTicketParamForKey(m_pClientContainer, key, ptype, value, pos);
}

int ComGUIManager::GetSystemTicketParamForKey(MTICKET_ACCESS const* container, char const* key,
                                              PARAM_TYPE ptype, void* value, int pos)
{
    return container->MGETPARAMETER(container->Instance, comgui::detail::SystemTicketType,
                                    comgui::detail::SystemTicketId, key, ptype, value, pos);
}

int ComGUIManager::GetValueCount(MTICKET_ACCESS const* container, int type, int id, wxString key)
{
    long long count = 0;
    int const found =
        container->MGETPARAMETER(container->Instance, type, id, key.utf8_str(), PARAM_COUNT, &count, -1);
    return found ? static_cast<int>(count) : 0;
}

wxArrayInt ComGUIManager::GetIntArray(int type, int id, char* key)
{
    return ReadIntArray([&](PARAM_TYPE ptype, void* value, int pos)
                        { return GetParameter(type, id, key, ptype, value, pos); });
}

wxArrayInt ComGUIManager::GetIntArray(MTICKET_ACCESS const* container, int type, int id, char* key)
{
    return ReadIntArray(ReaderOf(*this, container, type, id, key));
}

wxArrayInt ComGUIManager::GetIntArray(MTICKET_ACCESS const* container, int type, int id, wxString key)
{
    return ReadIntArray(ReaderOf(*this, container, type, id, key.utf8_str()));
}

wxArrayString ComGUIManager::GetStringArray(int type, int id, char* key)
{
    return ReadStringArray([&](PARAM_TYPE ptype, void* value, int pos)
                           { return GetParameter(type, id, key, ptype, value, pos); });
}

wxArrayString ComGUIManager::GetStringArray(MTICKET_ACCESS const* container, int type, int id, char* key)
{
    return ReadStringArray(ReaderOf(*this, container, type, id, key));
}

wxArrayString ComGUIManager::GetStringArray(MTICKET_ACCESS const* container, int type, int id, wxString key)
{
    return ReadStringArray(ReaderOf(*this, container, type, id, key.utf8_str()));
}

int ComGUIManager::DeleteTicketOfType(int type, int id)
{
    return DeleteTicketOfType(GetClientContainer(), type, id);
}

int ComGUIManager::DeleteTicketOfType(MTICKET_ACCESS const* container, int type, int id)
{
    return container->MOPERATION(container->Instance, type, id, MTICKET_OP_DELETE, nullptr);
}

int ComGUIManager::GetTicketData(int a, int b, int c, int* d, void* data)
{
    return GetTicketData(m_pLogin, a, b, c, d, data);
}

int ComGUIManager::GetTicketData(TLogin* login, int a, int b, int c, int* d, void* data)
{
    return m_interface.GetTicketDataEntry(m_hModuleInstance, login->hSession, a, b, c, d, data);
}
