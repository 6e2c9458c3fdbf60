#include "desk/view/FaultText.h"

#include "desk/model/DisplayText.h"
#include <comgui/client/Text.h>
#include <wx/intl.h>

namespace desk
{
namespace
{
constexpr std::size_t DetailLength = 120;  // characters

wxString SentenceOf(FileTrouble trouble)
{
    switch (trouble)
    {
    case FileTrouble::CannotRead:
        return _("The file cannot be read");
    case FileTrouble::CannotWrite:
        return _("The file cannot be written");
    case FileTrouble::NotAFile:
        return _("This is not a file");
    case FileTrouble::TooLarge:
        return _("This is too large for a ticket");
    case FileTrouble::NoMemory:
        return _("There is not enough memory");
    case FileTrouble::Empty:
        return _("The file is empty");
    case FileTrouble::UnknownForm:
        return _("This is neither the XML nor the stream of a ticket");
    case FileTrouble::ContainerStream:
        return _("This stream changes many tickets; it is not one ticket");
    case FileTrouble::BrokenStream:
        return _("The stream is broken");
    case FileTrouble::HoldsDeletion:
        return _("This stream deletes keys; it is not a ticket");
    case FileTrouble::BadPosition:
        return _("No ticket can have a value at this position");
    case FileTrouble::NotUtf8:
        return _("The XML is not in UTF-8");
    case FileTrouble::ControlCharacter:
        return _("The XML has a control character");
    case FileTrouble::BrokenXml:
        return _("The XML is broken");
    case FileTrouble::DocumentType:
        return _("The XML has a document type, which is not read");
    case FileTrouble::NotATicket:
        return _("The XML is not a ticket");
    case FileTrouble::UnknownVersion:
        return _("The ticket is of an unknown version");
    case FileTrouble::UnknownElement:
        return _("The XML has an unknown element");
    case FileTrouble::UnknownAttribute:
        return _("The XML has an unknown attribute");
    case FileTrouble::RepeatedAttribute:
        return _("The XML has an attribute twice");
    case FileTrouble::MissingAttribute:
        return _("The XML lacks an attribute");
    case FileTrouble::StrayText:
        return _("The XML has text where none belongs");
    case FileTrouble::BadReference:
        return _("The XML has a reference to no character");
    case FileTrouble::UnknownType:
        return _("The value is of an unknown type");
    case FileTrouble::UnknownEncoding:
        return _("The value is in an unknown encoding");
    case FileTrouble::NotANumber:
        return _("The value is not a number");
    case FileTrouble::OutOfRange:
        return _("The number is out of its type's range");
    case FileTrouble::NotBase64:
        return _("The value is not in base 64");
    case FileTrouble::RepeatedKey:
        return _("The ticket has a key twice");
    case FileTrouble::RepeatedPosition:
        return _("The key has a position twice");
    case FileTrouble::BadKey:
        return _("No ticket can have this key");
    case FileTrouble::BadText:
        return _("No ticket can hold this text");
    }
    return {};
}
}  // namespace

wxString TextOf(FileFault const& fault)
{
    wxString text = comgui::ToWx(DisplayText(fault.file, DetailLength)) + ": " + SentenceOf(fault.trouble);
    if (fault.line)
        text += " " + wxString::Format(_("(line %zu)"), *fault.line);
    if (fault.byte)
        text += " " + wxString::Format(_("(byte %zu)"), *fault.byte);
    if (!fault.detail.empty())
        text += ": " + comgui::ToWx(DisplayText(fault.detail, DetailLength));
    return text;
}
}  // namespace desk
