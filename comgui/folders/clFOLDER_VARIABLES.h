// Translates between absolute folder paths and their portable form, $(VARIABLE)/rest. A container's
// translator belongs to its module, which hands it out; so the class is a boundary of its own, and the
// order of its slots is frozen.
//
// Texts are UTF-8. No operation reports an error: what cannot be translated comes back as it was. The
// interface holds no lock; whoever implements it says from which threads it may be used.
#pragma once

#include <string>

class clSETMULTIPAR_FOLDER_VARIABLES;
struct SETMULTIPAR;

class clFOLDER_VARIABLES
{
public:
    virtual ~clFOLDER_VARIABLES() = default;

    // Whether it translates at all, in either direction.
    virtual bool IsEnabled() const = 0;

    // Builds the table of folders anew from the ticket server.
    virtual void Load() = 0;

    // An absolute path to its variable form.
    virtual std::string Encode(std::string const& path) const = 0;

    // The variable form of a path that is relative to the folder of a ticket key, or of a variable.
    virtual std::string Encode(char const* key, std::string relative) const = 0;
    virtual std::string EncodeV(char const* variable, std::string relative) const = 0;

    // A variable form to a path, with backslashes or with forward slashes.
    virtual std::string Decode(std::string const& path, bool backslashes) const = 0;

    // Adds or changes a mapping; a null folder removes it.
    virtual void SetFolderVariable(char const* variable, char const* folder) = 0;

    // A translator of whole parameter tables. The caller owns the result.
    virtual clSETMULTIPAR_FOLDER_VARIABLES*
    New_clSETMULTIPAR_FOLDER_VARIABLES(clFOLDER_VARIABLES* folders, SETMULTIPAR* table, bool encode) = 0;
};
