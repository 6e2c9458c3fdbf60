#include "standin/module/FolderTranslator.h"

#include "comgui/folders/FolderVariables.h"
#include "standin/module/Guard.h"
#include "standin/server/tickets/FolderTable.h"
#include <new>

namespace standin
{
namespace
{
constexpr unsigned long long Never = ~0ULL;
}

FolderTranslator::FolderTranslator(TicketServer& server) : m_server(server), m_loadedAt(Never)
{
    m_access.Instance = this;
    m_access.MOPERATION = OnOperation;  // to load takes no other slot
}

FolderTranslator::~FolderTranslator() = default;

bool FolderTranslator::HandOut(void* out)
{
    if (!out)
        return false;
    *static_cast<clFOLDER_VARIABLES**>(out) = this;
    return true;
}

bool FolderTranslator::IsEnabled() const { return UpToDate().IsEnabled(); }

void FolderTranslator::Load()
{
    std::lock_guard const lock(m_reload);
    Reload();
}

std::string FolderTranslator::Encode(std::string const& path) const { return UpToDate().Encode(path); }

std::string FolderTranslator::Encode(char const* key, std::string relative) const
{
    return UpToDate().Encode(key, std::move(relative));
}

std::string FolderTranslator::EncodeV(char const* variable, std::string relative) const
{
    return UpToDate().EncodeV(variable, std::move(relative));
}

std::string FolderTranslator::Decode(std::string const& path, bool backslashes) const
{
    return UpToDate().Decode(path, backslashes);
}

void FolderTranslator::SetFolderVariable(char const* variable, char const* folder)
{
    UpToDate().SetFolderVariable(variable, folder);
}

clSETMULTIPAR_FOLDER_VARIABLES*
FolderTranslator::New_clSETMULTIPAR_FOLDER_VARIABLES(clFOLDER_VARIABLES* folders, SETMULTIPAR* table,
                                                     bool encode)
{
    return UpToDate().New_clSETMULTIPAR_FOLDER_VARIABLES(folders, table, encode);
}

clFOLDER_VARIABLES& FolderTranslator::UpToDate() const
{
    if (m_loadedAt.load(std::memory_order_acquire) != m_server.SystemTicketChanges())
    {
        std::lock_guard const lock(m_reload);
        if (m_loadedAt.load(std::memory_order_relaxed) != m_server.SystemTicketChanges())
            Reload();
    }
    return *m_translator;
}

void FolderTranslator::Reload() const
{
    // Counted before anything is read: a change that comes meanwhile is one more reason to load.
    unsigned long long const changes = m_server.SystemTicketChanges();
    m_loadedAt.store(Never, std::memory_order_relaxed);  // what ends halfway is begun again
    m_copy.reset();
    if (m_translator)
        m_translator->Load();
    else
        m_translator.reset(CreateFolderVariables(&m_access));
    if (m_copy)  // else nothing is known
        m_loadedAt.store(changes, std::memory_order_release);
}

// Called while m_translator loads.
int FolderTranslator::OnOperation(void* instance, int type, int id, TICKET_OP op, void* arg)
{
    if (TicketAddress{type, id} != SystemTicket || op.GetInt() != MTICKET_OP_OPEN)
        return 0;
    return Guarded<int>(0,
                        [&]
                        {
                            auto const& self = *static_cast<FolderTranslator const*>(instance);
                            self.m_copy = self.CopyOfTheFolders();
                            *static_cast<STICKET_ACCESS const**>(arg) = self.m_copy->Access();
                            return 1;
                        });
}

std::unique_ptr<LocalTicket> FolderTranslator::CopyOfTheFolders() const
{
    auto copy = std::make_unique<LocalTicket>();
    STICKET_ACCESS const& ticket = *copy->Access();
    Session const nobody(0, User());  // with no limit to what it sees
    m_server.Visit(nobody, SystemTicket,
                   [&](std::string_view key, int pos, StoredValue const& stored)
                   {
                       if (!FolderSettings::Concern(key, pos))
                           return;
                       TicketValue const value = TicketValue::FromStored(stored);
                       BIN_STRING binary;
                       if (!ticket.SSETPARAMETER(ticket.Instance, std::string(key).c_str(), value.type,
                                                 value.Word(binary), pos))
                           throw std::bad_alloc();  // it refuses nothing that a ticket holds
                   });
    return copy;
}
}  // namespace standin
