#include "desk/model/ExportFile.h"

#include <algorithm>

namespace desk
{
namespace
{
constexpr std::string_view Xml = ".xml";
constexpr std::string_view Stream = ".stream";

char Lower(char letter) { return letter >= 'A' && letter <= 'Z' ? static_cast<char>(letter + 32) : letter; }

bool EndsWith(std::string_view name, std::string_view ending)
{
    return name.size() >= ending.size() &&
           std::equal(ending.rbegin(), ending.rend(), name.rbegin(),
                      [](char left, char right) { return left == Lower(right); });
}
}  // namespace

ExportFile ExportFileOf(std::string_view typed, FileForm chosen)
{
    bool const isStream = chosen == FileForm::Stream || EndsWith(typed, Stream);
    std::string_view const own = isStream ? Stream : Xml;
    std::string_view const other = isStream ? Xml : Stream;
    ExportFile file{std::string(typed), isStream ? FileForm::Stream : FileForm::Xml};
    if (EndsWith(typed, own))
        return file;
    if (EndsWith(typed, other))
        file.name.resize(typed.size() - other.size());
    file.name += own;
    return file;
}
}  // namespace desk
