// Ticket files, one call at a time: nothing stays open between two of them. When a change reaches the disk is
// the factory's affair.
#include "comgui/session/ComGUIManager.h"

#include "comgui/access/STICKET_MODIFY.h"
#include "comgui/access/STICKET_READ.h"
#include "comgui/session/LocalTicket.h"
#include <wx/filefn.h>

namespace
{
// The frame of them all. The path goes to the factory as it stands. ifNone: the result without a ticket,
// which differs from operation to operation. A ticket stays open when the operation throws: nothing guards
// it.
template <typename Result, typename Operation>
Result WithTicket(wxString const& path, Result ifNone, Operation operation)
{
    STICKET_ACCESS const* ticket = CreateTicket(path.utf8_str());
    if (!ticket)
        return ifNone;
    Result result = operation(ticket);
    DestroyTicket(ticket);
    return result;
}

// Takes the texts under a key one by one, up to the first position that cannot be read, a gap included.
template <typename Take>
void ForEachText(STICKET_ACCESS const* ticket, char const* key, Take take)
{
    wxString item;
    for (int pos = 0; STICKET_READ::Of(ticket)->GetParameter(key, item, pos); ++pos)
        take(item);
}

template <typename List>
List ReadTexts(wxString const& path, char const* key)
{
    return WithTicket(path, List(),
                      [&](STICKET_ACCESS const* ticket)
                      {
                          List list;
                          ForEachText(ticket, key, [&](wxString const& item) { list.Add(item); });
                          return list;
                      });
}

template <typename Value>
int WriteValue(wxString const& path, char const* key, Value const& value, int pos)
{
    return WithTicket(path, 0,
                      [&](STICKET_ACCESS const* ticket)
                      { return STICKET_MODIFY::Of(ticket)->SetParameter(key, value, pos); });
}
}  // namespace

int ComGUIManager::GetIntParameterFromLocal(wxString path, char const* key, int def, int pos)
{
    // Without a ticket -1 and not the default, which is for a missing key alone.
    return WithTicket(path, -1,
                      [&](STICKET_ACCESS const* ticket)
                      { return STICKET_READ::Of(ticket)->GetIntParameter(pos, key, def); });
}

wxString ComGUIManager::GetStringParameterFromLocal(wxString path, char const* key, int pos)
{
    return WithTicket(path, wxString(),
                      [&](STICKET_ACCESS const* ticket)
                      { return STICKET_READ::Of(ticket)->GetWxStringParameter(pos, key, wxEmptyString); });
}

double ComGUIManager::GetDoubleParameterFromLocal(wxString path, char const* key)
{
    return WithTicket(path, -1.0,
                      [&](STICKET_ACCESS const* ticket)
                      { return STICKET_READ::Of(ticket)->GetDoubleParameter(key, -1.0); });
}

wxStringList ComGUIManager::GetStringListParameterFromLocal(wxString path, char const* key)
{
    return ReadTexts<wxStringList>(path, key);
}

wxArrayString ComGUIManager::GetStringArrayParameterFromLocal(wxString path, char const* key)
{
    return ReadTexts<wxArrayString>(path, key);
}

wxArrayInt ComGUIManager::GetIntArrayParameterFromLocal(wxString path, char const* key)
{
    return WithTicket(path, wxArrayInt(),
                      [&](STICKET_ACCESS const* ticket)
                      {
                          // The default for a missing value marks the end, and so does a stored -1.
                          // The doubles below go by the count instead.
                          wxArrayInt array;
                          for (int pos = 0, value;
                               (value = STICKET_READ::Of(ticket)->GetIntParameter(pos, key, -1)) != -1; ++pos)
                              array.Add(value);
                          return array;
                      });
}

wxArrayDouble ComGUIManager::GetDoubleArrayFromLocal(wxString path, char const* key)
{
    return WithTicket(
        path, wxArrayDouble(),
        [&](STICKET_ACCESS const* ticket)
        {
            wxArrayDouble array;
            unsigned long const count = STICKET_READ::Of(ticket)->GetVectorSize(key);
            for (unsigned long pos = 0; pos < count; ++pos)
                array.Add(STICKET_READ::Of(ticket)->GetDoubleParameter(static_cast<int>(pos), key, -1.0));
            return array;
        });
}

int ComGUIManager::SetParameterToLocal(wxString path, char const* key, wxString value)
{
    return WriteValue(path, key, value, -1);
}

int ComGUIManager::SetParameterToLocal(wxString path, char const* key, wxString value, int pos)
{
    return WriteValue(path, key, value, pos);
}

int ComGUIManager::SetParameterToLocal(wxString path, char const* key, int value)
{
    return WriteValue(path, key, value, -1);
}

int ComGUIManager::SetParameterToLocal(wxString path, char const* key, double value)
{
    return WriteValue(path, key, value, -1);
}

int ComGUIManager::AddStringToStringListLocal(wxString path, char const* key, wxString value)
{
    return WithTicket(path, 0,
                      [&](STICKET_ACCESS const* ticket)
                      {
                          bool present = false;
                          ForEachText(ticket, key,
                                      [&](wxString const& item)
                                      { present = item.IsSameAs(value) || present; });
                          if (present)
                              return 0;
                          return STICKET_MODIFY::Of(ticket)->SetParameter(key, value, -2);
                      });
}

int ComGUIManager::DeleteParameterFromLocal(wxString path, char const* key, int pos)
{
    return WithTicket(path, 0,
                      [&](STICKET_ACCESS const* ticket)
                      { return STICKET_MODIFY::Of(ticket)->DelParameter(key, pos); });
}

int ComGUIManager::IsAliveBackward(TLogin* login)
{
    // Backslashes on every platform: whoever reads the path knows them.
    wxString const systemTicket = wxString::Format("%s\\tickets\\SYS_0000.xml", wxGetCwd());
    login->iServerPort =
        GetIntParameterFromLocal(systemTicket, "System/MasterSOAPPort", login->iServerPort, -1);
    m_iBackwardPort = static_cast<unsigned int>(login->iServerPort);  // the counter follows the server's port
    return IsAlive(login);
}
