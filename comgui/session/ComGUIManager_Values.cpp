// What a host's values (variants, lists, arrays, holders) become on their way to a container. Which tests an
// operation makes first differs from one to the next, and hosts rely on each as it is.
#include "comgui/session/ComGUIManager.h"

#include "comgui/access/MTICKET_ADMIN.h"
#include "comgui/access/MTICKET_MODIFY.h"
#include "comgui/access/MTICKET_READ.h"
#include "comgui/access/STICKET_MODIFY.h"
#include "comgui/folders/FolderVariables.h"
#include "comgui/session/SetDataHolder.h"
#include "comgui/ticket/MultiParList.h"
#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include "comgui/ticket/clFOLDER_VARIABLES.h"

namespace
{
constexpr int Refused = -1;  // not logged in, or no container
constexpr int NothingToWrite = -2005;
constexpr long NotReadable = -1;

// Holders on their way out: those that are left go with it, so that none is lost when memory runs out.
struct HOLDERS
{
    explicit HOLDERS(std::vector<SetDataHolder*>& holders) : next(holders.begin()), end(holders.end()) {}
    HOLDERS(HOLDERS const&) = delete;
    HOLDERS& operator=(HOLDERS const&) = delete;
    ~HOLDERS()
    {
        while (next != end)
            Drop();
    }
    void Drop() { delete *next++; }

    std::vector<SetDataHolder*>::iterator next;
    std::vector<SetDataHolder*>::iterator const end;
};

bool IsWritten(PARAM_TYPE type) { return type == PARAM_INT || type == PARAM_DOUBLE || type == PARAM_STRING; }

// Adds what is to be written, and deletes every holder. Returns what the last add gave, 0 without any.
int AddHolders(SETMULTIPAR_LIST& list, HOLDERS& holders)
{
    int result = 0;
    int type = -1;
    for (; holders.next != holders.end; holders.Drop())
    {
        SetDataHolder const* const holder = *holders.next;
        if (!holder)
            continue;
        // A type that is not for here leaves the one before it in force.
        if (IsWritten(holder->m_type) || holder->m_type == PARAM_COUNT)
            type = holder->m_type;
        // The word of a text goes on as it stands, narrow as it is.
        if (auto const current = static_cast<PARAM_TYPE>(type); IsWritten(current))
            result = MultiParListSetParameter(&list, holder->key, current, holder->m_value, holder->m_pos);
    }
    return result;
}

// Passes over what is none of these; the caller counts its position all the same.
void Add(SETMULTIPAR_LIST& list, char const* key, wxVariant const& value, int pos)
{
    wxString const type = value.GetType();
    if (type.IsSameAs("long", false))
        list.SetParameter(key, static_cast<int>(value.GetLong()), pos);
    else if (type.IsSameAs("double", false))
        list.SetParameter(key, value.GetDouble(), pos);
    else if (type.IsSameAs("string", false))
        list.SetParameter(key, value.GetString(), pos);
}
}  // namespace

// --- reading -----------------------------------------------------------------------------------------------

int ComGUIManager::GetParameter(MTICKET_ACCESS const* container, int type, int id, char const* key,
                                wxVariant& value, int pos)
{
    if (!m_bLoggedIn || !container)
        return Refused;
    if (!MTICKET_READ::Of(container)->GetWxVariantParameterChk(type, id, key, value, pos))
        value = wxVariant(NotReadable);
    return 1;  // even so: the variant tells
}

int ComGUIManager::GetParameterEx(MTICKET_ACCESS const* container, int type, int id, char const* key,
                                  wxVariant& value, int pos, wxVariant marker)
{
    if (!m_bLoggedIn || !container)
        return Refused;
    if (MTICKET_READ::Of(container)->GetWxVariantParameterChk(type, id, key, value, pos))
        return 1;
    if (marker == wxNullVariant)
        return 0;
    value = wxVariant(NotReadable);
    return 1;
}

bool ComGUIManager::GetKeyParameterType(MTICKET_ACCESS const* container, int type, int id, char const* key,
                                        int& ptype, int& elementType)
{
    ptype = 0;
    if (!m_bLoggedIn || !container)
        return false;
    ptype = MTICKET_READ::Of(container)->ParameterType(type, id, key, -1);
    if (ptype == PARAM_COUNT)
        elementType = MTICKET_READ::Of(container)->ParameterType(type, id, key, 0);
    return ptype != 0;
}

int ComGUIManager::GetIntParameter(int type, int id, char const* key, int def) const
{
    return MTICKET_READ::Of(m_pClientContainer)->GetIntParameter(type, id, key, def);
}

int ComGUIManager::GetIntParameter(int type, int id, int pos, char const* key, int def) const
{
    return MTICKET_READ::Of(m_pClientContainer)->GetIntParameter(type, id, pos, key, def);
}

double ComGUIManager::GetDoubleParameter(int type, int id, char const* key, double def) const
{
    return MTICKET_READ::Of(m_pClientContainer)->GetDoubleParameter(type, id, key, def);
}

double ComGUIManager::GetDoubleParameter(int type, int id, int pos, char const* key, int def) const
{
    return MTICKET_READ::Of(m_pClientContainer)->GetDoubleParameter(type, id, pos, key, def);
}

bool ComGUIManager::GetBoolParameter(int type, int id, int pos, char const* key, bool def) const
{
    return MTICKET_READ::Of(m_pClientContainer)->GetBoolParameter(type, id, pos, key, def);
}

bool ComGUIManager::GetParameter(int type, int id, char const* key, wxString& value, int pos) const
{
    return MTICKET_READ::Of(m_pClientContainer)->GetParameter(type, id, key, value, pos);
}

wxString ComGUIManager::GetwxStringParameter(int type, int id, char const* key, int pos) const
{
    wxString value;
    GetParameter(type, id, key, value, pos);
    return value;
}

bool ComGUIManager::GetVectorParameter(int type, int id, char const* key, std::vector<int>& out) const
{
    return MTICKET_READ::Of(m_pClientContainer)->GetVectorParameter(type, id, key, out);
}

bool ComGUIManager::GetVectorParameter(int type, int id, char const* key, std::vector<double>& out) const
{
    return MTICKET_READ::Of(m_pClientContainer)->GetVectorParameter(type, id, key, out);
}

bool ComGUIManager::GetVectorParameter(int type, int id, char const* key, std::vector<wxString>& out) const
{
    return MTICKET_READ::Of(m_pClientContainer)->GetVectorParameter(type, id, key, out);
}

// --- writing -----------------------------------------------------------------------------------------------

int ComGUIManager::SetMultiParameter(int type, int id, int, std::vector<SetDataHolder*>& holders)
{
    if (!m_bLoggedIn)
        return Refused;
    return SetMultiParameter(GetClientContainer(), type, id, 0, holders);
}

int ComGUIManager::SetMultiParameter(MTICKET_ACCESS const* container, int type, int id, int,
                                     std::vector<SetDataHolder*>& holders)
{
    if (!m_bLoggedIn)
        return Refused;
    if (holders.empty())
        return NothingToWrite;
    HOLDERS rest(holders);
    SETMULTIPAR_LIST list(false);
    int const result = AddHolders(list, rest);
    if (list.Size() == 0)
        return result;
    return container->MSETMULTIPAR(container->Instance, type, id, list.Table(false));
}

void ComGUIManager::SetMultiParameter(int type, int id, SETMULTIPAR_LIST& list)
{
    if (m_bLoggedIn)
        SetMultiParameter(GetClientContainer(), type, id, list);
}

void ComGUIManager::SetMultiParameter(MTICKET_ACCESS const* container, int type, int id,
                                      SETMULTIPAR_LIST& list)
{
    if (!m_bLoggedIn)
        return;
    STICKET_ACCESS const* const ticket = MTICKET_READ::Of(container)->OpenTicket(type, id);
    if (ticket && list.Size() != 0)
        STICKET_MODIFY::Of(ticket)->SetMultiParameter(list.Table(false));
}

int ComGUIManager::SetMultiParameter(MTICKET_ACCESS const* container, int type, int id, char const* key,
                                     wxList& values)
{
    SETMULTIPAR_LIST list(false);
    list.DelParameter(key, -1);  // first, so that values beyond the new ones go, too
    int pos = 0;
    for (wxObject* value : values)
        Add(list, key, *static_cast<wxVariant*>(value), pos++);
    SetMultiParameter(container, type, id, list);
    return 0;
}

int ComGUIManager::SetArrayParameter(MTICKET_ACCESS const* container, int type, int id, char const* key,
                                     wxArrayString& values)
{
    SETMULTIPAR_LIST list(false);
    list.DelParameter(key, -1);
    int pos = 0;
    for (wxString const& value : values)
        list.SetParameter(key, value, pos++);
    SetMultiParameter(container, type, id, list);
    return 0;
}

int ComGUIManager::DeleteParameter(int type, int id, char const* key, int pos)
{
    // The container of the process's manager, whichever this one is.
    return DeleteParameter(GetInstance()->GetClientContainer(), type, id, key, pos);
}

int ComGUIManager::DeleteParameter(MTICKET_ACCESS const* container, int type, int id, char const* key,
                                   int pos)
{
    return MTICKET_MODIFY::Of(container)->DelParameter(type, id, key, pos);
}

// --- tickets as wholes -------------------------------------------------------------------------------------

bool ComGUIManager::CreateOrOpenTicket(int type, int id, char const* const* keys)
{
    return CreateOrOpenTicket(m_pClientContainer, type, id, keys);
}

bool ComGUIManager::CreateOrOpenTicket(MTICKET_ACCESS const* container, int type, int id,
                                       char const* const* keys)
{
    return MTICKET_ADMIN::Of(container)->CreateOrOpenTicket(type, id, keys) != nullptr;
}

int ComGUIManager::CreateNextTicket(MTICKET_ACCESS const* container, int type)
{
    return MTICKET_ADMIN::Of(container)->CreateNextTicket(type);
}

int ComGUIManager::CloseTicket(MTICKET_ACCESS const* container, int type, int id)
{
    return MTICKET_ADMIN::Of(container)->CloseTicket(type, id, false);
}

int ComGUIManager::SetPartial(int type, int id, char const* const* keys)
{
    return SetPartial(m_pClientContainer, type, id, keys);
}

int ComGUIManager::SetPartial(MTICKET_ACCESS const* container, int type, int id, char const* const* keys)
{
    return MTICKET_MODIFY::Of(container)->SetPartial(type, id, keys);
}

// --- paths -------------------------------------------------------------------------------------------------

std::string ComGUIManager::GetDecodedPath(std::string path)
{
    if (!m_bLoggedIn)
        return {};
    // For good: a logout does not end it, and it goes on with the container of its first session.
    if (!m_pFolderVariables)
        m_pFolderVariables = CreateFolderVariables(m_pClientContainer);
    path = m_pFolderVariables->Decode(path, false);
    return path;
}
