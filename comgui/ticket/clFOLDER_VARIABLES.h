// Turns folder paths of this machine into their portable form, $(VARIABLE)/rest, and back. A container's
// translator belongs to its module, which hands it out; so the class is a boundary of its own, and the
// order of its slots is frozen.
//
// Texts are UTF-8. Nothing fails: a path that no mapping fits is handed back unchanged. Whoever implements
// it says from which threads it may be used.
#pragma once

#include <string>

class clSETMULTIPAR_FOLDER_VARIABLES;
struct SETMULTIPAR;

class clFOLDER_VARIABLES
{
public:
    virtual ~clFOLDER_VARIABLES() = default;

    // If not, every path passes through as it is, in both directions.
    virtual bool IsEnabled() const = 0;

    // Forgets the mappings and asks the server's tickets for them once more.
    virtual void Load() = 0;

    // path: absolute, of this machine.
    virtual std::string Encode(std::string const& path) const = 0;

    // The same for what lies at relative below a folder, which is named by its key in the system ticket or
    // by its variable.
    virtual std::string Encode(char const* key, std::string relative) const = 0;
    virtual std::string EncodeV(char const* variable, std::string relative) const = 0;

    // Back to a path of this machine, whose separators are backslashes or else forward slashes.
    virtual std::string Decode(std::string const& path, bool backslashes) const = 0;

    // Maps the variable to that folder from now on; null: to none.
    virtual void SetFolderVariable(char const* variable, char const* folder) = 0;

    // A translator of whole parameter tables. The caller owns the result.
    virtual clSETMULTIPAR_FOLDER_VARIABLES*
    New_clSETMULTIPAR_FOLDER_VARIABLES(clFOLDER_VARIABLES* folders, SETMULTIPAR* table, bool encode) = 0;
};
