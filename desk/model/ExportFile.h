// The file of an export, by the name and the kind that the user has chosen.
#pragma once

#include <string>
#include <string_view>

namespace desk
{
enum class FileForm
{
    Xml,
    Stream,
};

struct ExportFile
{
    std::string name;
    FileForm form = FileForm::Xml;
};

// XML is what the dialog begins with: a name in .stream asks for a stream there, too. The name gets the
// ending of its form, in place of that of the other one; letter case does not matter.
ExportFile ExportFileOf(std::string_view typed, FileForm chosen);
}  // namespace desk
