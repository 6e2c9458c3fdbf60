#include "standin/module/FolderTranslator.h"

#include "comgui/folders/FolderVariables.h"
#include "comgui/ticket/MTICKET_ACCESS.h"
#include "comgui/ticket/TICKET_OP.h"
#include "standin/module/LocalTicket.h"
#include "standin/module/ValueWords.h"
#include "standin/server/files/ForkedChild.h"
#include <new>

namespace standin
{
// The library's translator, with the folders of one version of the system ticket. The library loads from a
// container; this one has a single ticket, 0/0, with nothing in it but the folders: all of them, whatever the
// session limits itself to, and of one moment.
class FolderTranslator::Loaded
{
public:
    explicit Loaded(TicketService& tickets)
    {
        tickets.LookAt(SystemTicket, 0,
                       [this](TicketSnapshot const& ticket)
                       {
                           m_revision = ticket.Which().revision;
                           Take(ticket, UseFolderVariablesKey);
                           for (FolderRow const row : FolderRows)
                               Take(ticket, row.key);
                           return true;
                       });
        m_container.Instance = this;
        m_container.MOPERATION = OnOperation;  // to load takes no other slot
        m_translator.reset(CreateFolderVariables(&m_container));
    }
    Loaded() { m_translator.reset(CreateFolderVariables(nullptr)); }
    Loaded(Loaded const&) = delete;
    Loaded& operator=(Loaded const&) = delete;

    Sequence Revision() const { return m_revision; }
    clFOLDER_VARIABLES& Translator() const { return *m_translator; }

private:
    void Take(TicketSnapshot const& system, char const* key)
    {
        KeyValues const* const values = system.Find(std::string_view(key));
        TicketElement const* const element = values ? values->At(0) : nullptr;
        BIN_STRING binary;
        STICKET_ACCESS const& copy = *m_folders.Access();
        if (element && !copy.SSETPARAMETER(copy.Instance, key, element->type, WordOf(*element, binary), -1))
            throw std::bad_alloc();  // it refuses nothing that a ticket holds
    }

    static int OnOperation(void* instance, int type, int id, TICKET_OP op, void* arg)
    {
        if (TicketAddress{type, id} != SystemTicket || op.GetInt() != MTICKET_OP_OPEN)
            return 0;
        *static_cast<STICKET_ACCESS const**>(arg) = static_cast<Loaded const*>(instance)->m_folders.Access();
        return 1;
    }

    Sequence m_revision = 0;
    LocalTicket m_folders;
    MTICKET_ACCESS m_container{};
    std::unique_ptr<clFOLDER_VARIABLES> m_translator;
};

FolderTranslator::FolderTranslator(TicketService& tickets) : m_tickets(tickets) {}

FolderTranslator::~FolderTranslator() = default;

std::shared_ptr<FolderTranslator::Loaded> FolderTranslator::UpToDate() const
{
    if (IsForkedChild())
        return std::make_shared<Loaded>();  // paths stay as they are
    Sequence const revision = m_tickets.SystemTicketRevision();
    {
        std::lock_guard const lock(m_lock);
        if (m_loaded && m_loaded->Revision() >= revision)
            return m_loaded;
    }
    auto const loaded = std::make_shared<Loaded>(m_tickets);
    std::lock_guard const lock(m_lock);
    if (!m_loaded || m_loaded->Revision() < loaded->Revision())
        m_loaded = loaded;
    return m_loaded;
}

void FolderTranslator::Load()
{
    if (IsForkedChild())
        return;
    {
        std::lock_guard const lock(m_lock);
        m_loaded.reset();
    }
    UpToDate();
}

bool FolderTranslator::IsEnabled() const { return UpToDate()->Translator().IsEnabled(); }

std::string FolderTranslator::Encode(std::string const& path) const
{
    return UpToDate()->Translator().Encode(path);
}

std::string FolderTranslator::Encode(char const* key, std::string relative) const
{
    return UpToDate()->Translator().Encode(key, std::move(relative));
}

std::string FolderTranslator::EncodeV(char const* variable, std::string relative) const
{
    return UpToDate()->Translator().EncodeV(variable, std::move(relative));
}

std::string FolderTranslator::Decode(std::string const& path, bool backslashes) const
{
    return UpToDate()->Translator().Decode(path, backslashes);
}

void FolderTranslator::SetFolderVariable(char const* variable, char const* folder)
{
    UpToDate()->Translator().SetFolderVariable(variable, folder);
}

clSETMULTIPAR_FOLDER_VARIABLES*
FolderTranslator::New_clSETMULTIPAR_FOLDER_VARIABLES(clFOLDER_VARIABLES* folders, SETMULTIPAR* table,
                                                     bool encode)
{
    return UpToDate()->Translator().New_clSETMULTIPAR_FOLDER_VARIABLES(folders, table, encode);
}
}  // namespace standin
