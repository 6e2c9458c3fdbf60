// The translator of folder paths that a session's container and its tickets hand out. It follows the system
// ticket: each operation goes by the folders of this moment. A folder that a client set with
// SetFolderVariable is good until the system ticket changes. For any thread.
#pragma once

#include "comgui/ticket/clFOLDER_VARIABLES.h"
#include "standin/server/sessions/TicketService.h"

namespace standin
{
class FolderTranslator : public clFOLDER_VARIABLES
{
public:
    // The service outlives it. Nothing is read before the first operation.
    explicit FolderTranslator(TicketService& tickets);
    ~FolderTranslator() override;

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
    class Loaded;
    std::shared_ptr<Loaded> UpToDate() const;

    TicketService& m_tickets;
    mutable std::mutex m_lock;
    mutable std::shared_ptr<Loaded> m_loaded;  // null before the first operation, and for Load
};
}  // namespace standin
