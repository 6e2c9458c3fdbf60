#include "standin/server/tickets/TicketXmlReader.h"

#include "standin/server/files/Report.h"
#include "standin/server/tickets/TicketSnapshot.h"
#include "standin/server/tickets/TicketXmlText.h"
#include <algorithm>
#include <charconv>
#include <climits>
#include <iterator>
#include <set>
#include <utility>

namespace standin
{
namespace
{
struct TypeName
{
    PARAM_TYPE type;
    char const* name;
};
constexpr TypeName TypeNames[] = {
    {PARAM_INT, "int"},
    {PARAM_DOUBLE, "double"},
    {PARAM_STRING, "string"},
    {PARAM_BINSTRING, "binary"},
    {PARAM_INT64, "int64"},
    {PARAM_UNSIGNED, "unsigned"},
    {PARAM_UNSIGNED64, "unsigned64"},
};

constexpr char const* WhiteSpace = " \t\r\n";

std::string_view Trimmed(std::string_view text)
{
    std::size_t const first = text.find_first_not_of(WhiteSpace);
    return first == std::string_view::npos
               ? std::string_view()
               : text.substr(first, text.find_last_not_of(WhiteSpace) - first + 1);
}

bool IsText(pugi::xml_node node)
{
    return node.type() == pugi::node_pcdata || node.type() == pugi::node_cdata;
}

bool IsXmlCharacter(unsigned long code)
{
    return code == '\t' || code == '\n' || code == '\r' || (code >= 0x20 && code < 0xD800) ||
           (code >= 0xE000 && code < 0xFFFE) || (code >= 0x10000 && code <= 0x10FFFF);
}

// Where the text names by its number what is no character. The parser would take the number modulo 2^32, and
// a zero would end a string unseen.
std::size_t FirstWrongReference(std::string_view text)
{
    for (std::size_t at = text.find("&#"); at != std::string_view::npos; at = text.find("&#", at + 1))
    {
        std::string_view digits = text.substr(at + 2);
        bool const isHex = digits.starts_with('x');
        digits.remove_prefix(isHex ? 1 : 0);
        unsigned long code = 0;
        auto const [end, error] =
            std::from_chars(digits.data(), digits.data() + digits.size(), code, isHex ? 16 : 10);
        bool const isReference =
            error != std::errc::invalid_argument && end != digits.data() + digits.size() && *end == ';';
        if (isReference && (error != std::errc() || !IsXmlCharacter(code)))
            return at;
    }
    return std::string_view::npos;
}

enum class NumberError
{
    None,
    NotANumber,
    OutOfRange,
};

template <typename T>
NumberError ReadNumber(std::string_view text, T& number)
{
    std::string_view const digits = Trimmed(text);
    auto const [end, code] = std::from_chars(digits.data(), digits.data() + digits.size(), number);
    if (code == std::errc::result_out_of_range)
        return NumberError::OutOfRange;
    return code == std::errc() && end == digits.data() + digits.size() ? NumberError::None
                                                                       : NumberError::NotANumber;
}

template <typename T>
NumberError ReadInteger(std::string_view text, StoredValue& value)
{
    T number = 0;
    NumberError const error = ReadNumber(text, number);
    value.integer = static_cast<long long>(number);
    return error;
}

NumberError ReadNumberOfType(std::string_view text, StoredValue& value)
{
    switch (value.type)
    {
    case PARAM_INT:
        return ReadInteger<int>(text, value);
    case PARAM_INT64:
        return ReadInteger<long long>(text, value);
    case PARAM_UNSIGNED:
        return ReadInteger<unsigned>(text, value);
    case PARAM_UNSIGNED64:
        return ReadInteger<unsigned long long>(text, value);
    default:
        return ReadNumber(text, value.number);
    }
}
}  // namespace

char const* XmlNameOf(PARAM_TYPE type)
{
    auto const* const found = std::find_if(std::begin(TypeNames), std::end(TypeNames),
                                           [type](TypeName const& entry) { return entry.type == type; });
    return found == std::end(TypeNames) ? nullptr : found->name;
}

PARAM_TYPE TypeOfXmlName(std::string_view name)
{
    auto const* const found = std::find_if(std::begin(TypeNames), std::end(TypeNames),
                                           [name](TypeName const& entry) { return entry.name == name; });
    return found == std::end(TypeNames) ? PARAM_NONE : found->type;
}

TicketXmlReader::TicketXmlReader(std::string_view text, std::string name)
    : m_text(text), m_name(std::move(name))
{
    if (m_text.size() > TicketXml::SizeLimit)
        FailAt(0, "larger than " + std::to_string(TicketXml::SizeLimit >> 20) + " MiB");
    if (m_text.starts_with("\xEF\xBB\xBF"))
        m_text.remove_prefix(3);
    if (std::size_t const offset = FirstForbiddenInXml(m_text); offset != std::string_view::npos)
        FailAt(offset, "not UTF-8, or a control character; such a value is written as base64");
    if (std::size_t const offset = FirstWrongReference(m_text); offset != std::string_view::npos)
        FailAt(offset, "no number of a character that XML allows; such a value is written as base64");
    // White space counts in strings, so all of it is kept; text beside the root is kept to be refused.
    unsigned const options = pugi::parse_cdata | pugi::parse_escapes | pugi::parse_eol |
                             pugi::parse_ws_pcdata | pugi::parse_fragment;
    auto const result = m_document.load_buffer(m_text.data(), m_text.size(), options, pugi::encoding_utf8);
    if (!result)
        FailAt(static_cast<std::size_t>(std::max<std::ptrdiff_t>(result.offset, 0)), result.description());
}

pugi::xml_node TicketXmlReader::Root(char const* name) const
{
    std::vector<pugi::xml_node> const roots = Elements(m_document);
    if (roots.empty())
        FailAt(0, std::string("no <") + name + "> in it");
    if (roots[0].name() != std::string_view(name))
        Fail(roots[0], std::string("<") + name + "> expected, not <" + roots[0].name() + ">");
    if (roots.size() > 1)
        Fail(roots[1], std::string("a second <") + roots[1].name() + "> behind the end");
    if (Number(roots[0], "version", INT_MAX) != 1)
        Fail(roots[0], "version 1 expected; a newer version of the program may have written this");
    return roots[0];
}

std::vector<pugi::xml_node> TicketXmlReader::Elements(pugi::xml_node node) const
{
    std::vector<pugi::xml_node> elements;
    for (pugi::xml_node const child : node)
    {
        if (IsText(child) && !Trimmed(child.value()).empty())
            Fail(child, "text where none is expected: " + std::string(Trimmed(child.value()).substr(0, 40)));
        if (child.type() == pugi::node_element)
            elements.push_back(child);
    }
    return elements;
}

void TicketXmlReader::ExpectNothingIn(pugi::xml_node node) const
{
    for (pugi::xml_node const child : Elements(node))
        Fail(child, std::string("unknown element <") + child.name() + ">");
}

void TicketXmlReader::ExpectAttributes(pugi::xml_node node,
                                       std::initializer_list<std::string_view> known) const
{
    std::set<std::string_view> seen;
    for (pugi::xml_attribute const attribute : node.attributes())
    {
        if (std::find(known.begin(), known.end(), attribute.name()) == known.end())
            Fail(node, std::string("unknown attribute ") + attribute.name());
        if (!seen.insert(attribute.name()).second)
            Fail(node, std::string("the attribute ") + attribute.name() + " stands twice");
    }
}

std::string TicketXmlReader::Attribute(pugi::xml_node node, char const* name) const
{
    pugi::xml_attribute const attribute = node.attribute(name);
    if (!attribute)
        Fail(node, std::string("the attribute ") + name + " is missing in <" + node.name() + ">");
    return attribute.value();
}

int TicketXmlReader::Number(pugi::xml_node node, char const* name, int highest) const
{
    std::string const text = Attribute(node, name);
    int number = 0;
    NumberError const error = ReadNumber(text, number);
    if (error == NumberError::NotANumber)
        Fail(node, std::string(name) + " is not a number: " + text);
    if (error == NumberError::OutOfRange || number < 0 || number > highest)
        Fail(node, std::string(name) + " is out of range: " + text);
    return number;
}

TicketXml TicketXmlReader::Ticket(pugi::xml_node node) const
{
    ExpectAttributes(node, {"version", "type", "id"});
    TicketXml ticket;
    if (node.attribute("type") || node.attribute("id"))
        ticket.address = {Number(node, "type", 99), Number(node, "id", 0xFFFFFF)};
    std::set<std::string> keys;
    for (pugi::xml_node const child : Elements(node))
    {
        if (child.name() != std::string_view("parameter"))
            Fail(child, std::string("unknown element <") + child.name() + ">");
        ExpectAttributes(child, {"key", "key-encoding", "type", "encoding"});
        if (!keys.insert(Key(child)).second)
            Fail(child, "the key " + Attribute(child, "key") + " stands twice");
        Parameter(ticket, child);
    }
    return ticket;
}

void TicketXmlReader::Parameter(TicketXml& ticket, pugi::xml_node node) const
{
    std::string const key = Key(node);
    PARAM_TYPE const type = Type(node);
    if (!node.find_child([](pugi::xml_node child) { return child.type() == pugi::node_element; }))
        return Value(ticket, key, 0, type, node);
    if (node.attribute("encoding"))
        Fail(node, "encoding belongs to each <value> where there are any");
    std::set<int> positions;
    for (pugi::xml_node const child : Elements(node))
    {
        if (child.name() != std::string_view("value"))
            Fail(child, std::string("unknown element <") + child.name() + ">");
        ExpectAttributes(child, {"pos", "type", "encoding"});
        int const pos = Number(child, "pos", LargestPosition);
        if (!positions.insert(pos).second)
            Fail(child, "position " + std::to_string(pos) + " stands twice");
        Value(ticket, key, pos, child.attribute("type") ? Type(child) : type, child);
    }
}

std::string TicketXmlReader::Key(pugi::xml_node node) const
{
    std::string key = Attribute(node, "key");
    if (node.attribute("key-encoding"))
    {
        if (Attribute(node, "key-encoding") != "base64")
            Fail(node, "unknown encoding " + Attribute(node, "key-encoding"));
        key = Decoded(node, key);
    }
    if (key.empty() || key.find('\0') != std::string::npos)
        Fail(node, "a key is a text of at least one byte, without a zero byte");
    return key;
}

void TicketXmlReader::Value(TicketXml& ticket, std::string const& key, int pos, PARAM_TYPE type,
                            pugi::xml_node node) const
{
    StoredValue value;
    value.type = type;
    bool const isText = type == PARAM_STRING || type == PARAM_BINSTRING;
    std::string const text = isText ? String(node, type) : Content(node);
    if (isText)
        value.bytes = text;
    else if (node.attribute("encoding"))
        Fail(node, "a number has no encoding");
    else
    {
        NumberError const error = ReadNumberOfType(text, value);
        if (error == NumberError::NotANumber)
            Fail(node, std::string("not a number of type ") + XmlNameOf(type) + ": " + text.substr(0, 40));
        if (error == NumberError::OutOfRange)
            Fail(node, std::string("out of range of type ") + XmlNameOf(type) + ": " + text.substr(0, 40));
    }
    ticket.Put(key, pos, value);
}

PARAM_TYPE TicketXmlReader::Type(pugi::xml_node node) const
{
    std::string const name = Attribute(node, "type");
    PARAM_TYPE const type = TypeOfXmlName(name);
    if (type == PARAM_NONE)
        Fail(node, "unknown type " + name);
    return type;
}

std::string TicketXmlReader::String(pugi::xml_node node, PARAM_TYPE type) const
{
    std::string text = Content(node);
    if (node.attribute("encoding") && Attribute(node, "encoding") != "base64")
        Fail(node, "unknown encoding " + Attribute(node, "encoding"));
    if (type == PARAM_STRING && !node.attribute("encoding"))
        return text;
    std::string bytes = Decoded(node, text);
    if (type == PARAM_STRING && bytes.find('\0') != std::string::npos)
        Fail(node, "a zero byte in a string; type binary may hold it");
    return bytes;
}

std::string TicketXmlReader::Content(pugi::xml_node node) const
{
    std::string content;
    for (pugi::xml_node const child : node)
    {
        if (!IsText(child))
            Fail(child, std::string("unknown element <") + child.name() + ">");
        content += child.value();
    }
    return content;
}

std::string TicketXmlReader::Decoded(pugi::xml_node node, std::string const& text) const
{
    std::optional<std::string> bytes = DecodeBase64(text);
    if (!bytes)
        Fail(node, "not base64: " + text.substr(0, 40));
    return std::move(*bytes);
}

void TicketXmlReader::Fail(pugi::xml_node node, std::string const& reason) const
{
    FailAt(static_cast<std::size_t>(std::max<std::ptrdiff_t>(node.offset_debug(), 0)), reason);
}

void TicketXmlReader::FailAt(std::size_t offset, std::string const& reason) const
{
    std::string_view const before = m_text.substr(0, offset);
    auto const line = 1 + std::count(before.begin(), before.end(), '\n');
    // One line: the reason may quote what the text has.
    throw XmlError(ForMessages(m_name + ":" + std::to_string(line) + ": " + reason));
}
}  // namespace standin
