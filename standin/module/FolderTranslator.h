// The translator of folder paths that a session's container and its tickets hand out. It follows the system
// ticket: each operation goes by the folders of this moment. A folder that a client set with
// SetFolderVariable is good until the system ticket changes. For any thread.
#pragma once

#include "comgui/folders/clFOLDER_VARIABLES.h"
#include "comgui/ticket/MTICKET_ACCESS.h"
#include "standin/module/LocalTicket.h"
#include "standin/server/site/TicketServer.h"

namespace standin
{
class FolderTranslator : public clFOLDER_VARIABLES
{
public:
    // The server outlives it. Nothing is read before the first operation.
    explicit FolderTranslator(TicketServer& server);
    ~FolderTranslator() override;

    // Puts its address to where a clFOLDER_VARIABLES* is wanted; false for null.
    bool HandOut(void* out);

    bool IsEnabled() const override;
    void Load() override;
    std::string Encode(std::string const& path) const override;
    std::string Encode(char const* key, std::string relative) const override;
    std::string EncodeV(char const* variable, std::string relative) const override;
    std::string Decode(std::string const& path, bool backslashes) const override;
    void SetFolderVariable(char const* variable, char const* folder) override;
    clSETMULTIPAR_FOLDER_VARIABLES*
    New_clSETMULTIPAR_FOLDER_VARIABLES(clFOLDER_VARIABLES* folders, SETMULTIPAR* table, bool encode) override;

private:
    clFOLDER_VARIABLES& UpToDate() const;  // the library's translator
    void Reload() const;                   // with m_reload locked

    // What the library's translator loads from is no client's view of the system ticket but a copy of what it
    // says of folders: of one moment, all of them whatever the session limits itself to, and not counted
    // among its open tickets. And no text of it goes away if the session ends meanwhile.
    static int OnOperation(void* instance, int type, int id, TICKET_OP op, void* arg);
    std::unique_ptr<LocalTicket> CopyOfTheFolders() const;

    TicketServer& m_server;
    MTICKET_ACCESS m_access{};

    mutable std::mutex m_reload;
    mutable std::unique_ptr<LocalTicket> m_copy;  // of the last load; null if it could not be made
    mutable std::unique_ptr<clFOLDER_VARIABLES> m_translator;
    mutable std::atomic<unsigned long long> m_loadedAt;  // after so many changes of the system ticket
};
}  // namespace standin
