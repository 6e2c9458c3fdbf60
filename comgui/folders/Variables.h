// The folders that a server can have: where the system ticket keeps each, and what it is called in a path.
#pragma once

namespace comgui::detail
{
struct FOLDER_VARIABLE
{
    char const* key;
    char const* variable;
};

// Ends at a row of two nulls. The order counts: a folder may be defined in terms of those before it.
extern FOLDER_VARIABLE const Variables[];
}  // namespace comgui::detail
