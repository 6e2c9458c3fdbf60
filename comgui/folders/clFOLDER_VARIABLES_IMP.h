// The translator of the server's folders, the only one of the library: a snapshot of what the system ticket
// said at the last Load(), with what SetFolderVariable did to it since. From any thread: each operation holds
// the lock from its beginning to its end.
#pragma once

#include "comgui/folders/FOLDER_INDEX.h"
#include "comgui/folders/FOLDER_MAPPING.h"
#include "comgui/foundation/SysLib.h"
#include "comgui/ticket/MTICKET_ACCESS.h"
#include "comgui/ticket/clFOLDER_VARIABLES.h"
#include <optional>
#include <string>
#include <vector>

namespace comgui::detail
{
class clFOLDER_VARIABLES_IMP : public clFOLDER_VARIABLES
{
public:
    // Loads from the container, which must outlive this. With null there is nothing to load from, and all
    // that SetFolderVariable brings is translated both ways.
    explicit clFOLDER_VARIABLES_IMP(MTICKET_ACCESS const* container);

    bool IsEnabled() const override;
    void Load() override;
    std::string Encode(std::string const& path) const override;
    std::string Encode(char const* key, std::string relative) const override;
    std::string EncodeV(char const* variable, std::string relative) const override;
    std::string Decode(std::string const& path, bool backslashes) const override;
    void SetFolderVariable(char const* variable, char const* folder) override;

    // Translates with the given folders, and not with its own.
    clSETMULTIPAR_FOLDER_VARIABLES*
    New_clSETMULTIPAR_FOLDER_VARIABLES(clFOLDER_VARIABLES* folders, SETMULTIPAR* table, bool encode) override;

private:
    // As System/UseFolderVariables has them.
    enum FLAG : unsigned
    {
        DECODES = 1,
        ENCODES = 2,
    };

    // With the lock held.
    FOLDER_INDEX const& Index() const;

    mutable SysLib::MUTEX_INSTANCE mutex;
    MTICKET_ACCESS const* access;          // may be null
    std::vector<FOLDER_MAPPING> mappings;  // in the order in which they came; of equal ones the first counts
    unsigned flags;                        // of FLAG
    mutable std::optional<FOLDER_INDEX> index;  // none if the mappings have changed since it was needed
};
}  // namespace comgui::detail
