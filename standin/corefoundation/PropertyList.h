// A file with a property list, XML or binary.
#pragma once

#include <filesystem>
#include <memory>
#include <plist/plist.h>
#include <type_traits>

namespace comgui::detail
{
struct PlistFree
{
    void operator()(plist_t node) const { plist_free(node); }
};
using Plist = std::unique_ptr<std::remove_pointer_t<plist_t>, PlistFree>;

// Null if there is no such file, or no sound property list in it: one of XML is UTF-8, with or without a
// byte order mark, closes what it opens, and its dates are dates.
Plist ReadPropertyList(std::filesystem::path const& file);
}  // namespace comgui::detail
