// A translator that remembers what it was asked and answers "<...>".
#pragma once

#include "comgui/ticket/clFOLDER_VARIABLES.h"
#include <string>
#include <vector>

class FolderVariablesFake : public clFOLDER_VARIABLES
{
public:
    mutable std::vector<std::string> decoded;
    mutable bool backslashesAsked = false;

    std::string Decode(std::string const& path, bool backslashes) const override
    {
        decoded.push_back(path);
        backslashesAsked = backslashesAsked || backslashes;
        return "<" + path + ">";
    }

    // Typed access only decodes.
    bool IsEnabled() const override { return true; }
    void Load() override {}
    std::string Encode(std::string const& path) const override { return path; }
    std::string Encode(char const*, std::string relative) const override { return relative; }
    std::string EncodeV(char const*, std::string relative) const override { return relative; }
    void SetFolderVariable(char const*, char const*) override {}
    clSETMULTIPAR_FOLDER_VARIABLES* New_clSETMULTIPAR_FOLDER_VARIABLES(clFOLDER_VARIABLES*, SETMULTIPAR*,
                                                                       bool) override
    {
        return nullptr;
    }
};
