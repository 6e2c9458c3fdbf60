#include "desk/model/TicketXml.h"

#include "comgui/client/Text.h"
#include "desk/model/FileContent.h"
#include <algorithm>
#include <charconv>
#include <initializer_list>
#include <new>
#include <pugixml.hpp>
#include <set>
#include <vector>
#include <wx/base64.h>

namespace desk
{
namespace
{
using comgui::Value;

// Above this the parser's tree takes too much memory: 64 bytes an element.
constexpr std::size_t MostTags = std::size_t{8} << 20;

constexpr std::string_view WhiteSpace = " \t\r\n";

struct TypeName
{
    std::string_view name;
    PARAM_TYPE type;
};
constexpr TypeName TypeNames[] = {
    {"int", PARAM_INT},
    {"double", PARAM_DOUBLE},
    {"string", PARAM_STRING},
    {"binary", PARAM_BINSTRING},
    {"int64", PARAM_INT64},
    {"unsigned", PARAM_UNSIGNED},
    {"unsigned64", PARAM_UNSIGNED64},
};

bool IsText(pugi::xml_node node)
{
    return node.type() == pugi::node_pcdata || node.type() == pugi::node_cdata;
}

std::string_view Trimmed(std::string_view text)
{
    auto const begin = text.find_first_not_of(WhiteSpace);
    return begin == text.npos ? std::string_view()
                              : text.substr(begin, text.find_last_not_of(WhiteSpace) - begin + 1);
}

bool IsAscii(std::string_view text)
{
    return std::all_of(text.begin(), text.end(), [](char c) { return static_cast<unsigned char>(c) < 0x80; });
}

bool IsControl(char c)
{
    return static_cast<unsigned char>(c) < 0x20 && WhiteSpace.find(c) == WhiteSpace.npos;
}

std::string Utf8Of(unsigned int code)
{
    return comgui::ToUtf8(wxString(wxUniChar(static_cast<wxUniChar::value_type>(code))));
}

// The character of a reference, between "&" and ";"; none if that is no reference. The parser would take a
// wrong one as text, and a number modulo 2^32.
std::optional<std::string> CharacterOf(std::string_view reference)
{
    constexpr std::pair<std::string_view, char> Named[] = {
        {"amp", '&'}, {"lt", '<'}, {"gt", '>'}, {"quot", '"'}, {"apos", '\''}};
    for (auto const& [name, character] : Named)
        if (reference == name)
            return std::string(1, character);
    if (!reference.starts_with('#'))
        return std::nullopt;
    bool const isHex = reference.starts_with("#x");
    std::string_view const digits = reference.substr(isHex ? 2 : 1);
    unsigned int code = 0;
    auto const [end, error] =
        std::from_chars(digits.data(), digits.data() + digits.size(), code, isHex ? 16 : 10);
    bool const isCharacter = code == '\t' || code == '\n' || code == '\r' ||
                             (code >= 0x20 && code < 0xD800) || (code >= 0xE000 && code < 0xFFFE) ||
                             (code >= 0x10000 && code <= 0x10FFFF);
    if (error != std::errc() || end != digits.data() + digits.size() || !isCharacter)
        return std::nullopt;
    return Utf8Of(code);
}

class XmlReader
{
public:
    XmlReader(std::string_view xml, std::string const& file) : m_xml(xml), m_file(file)
    {
        if (m_xml.size() > LargestFile ||
            std::count(m_xml.begin(), m_xml.end(), '<') > std::ptrdiff_t{MostTags})
            FailAtLine(FileTrouble::TooLarge, {}, {});
        CheckCharacters();
        // References are resolved here, white space counts in texts, and what lies beside the root is
        // refused.
        unsigned const options = pugi::parse_cdata | pugi::parse_eol | pugi::parse_ws_pcdata |
                                 pugi::parse_fragment | pugi::parse_doctype;
        auto const result = m_document.load_buffer(m_xml.data(), m_xml.size(), options, pugi::encoding_utf8);
        if (result.status == pugi::status_out_of_memory)
            throw std::bad_alloc();
        if (!result)
            FailAtLine(FileTrouble::BrokenXml, LineOf(result.offset), result.description());
    }

    TicketOfFile Ticket()
    {
        pugi::xml_node const root = Root();
        ExpectAttributes(root, {"version", "type", "id"});
        if (Attribute(root, "version") != "1")
            Fail(FileTrouble::UnknownVersion, root, Attribute(root, "version"));
        TicketOfFile result;
        if (root.attribute("type") || root.attribute("id"))
            result.address = {Number(root, "type", 99), Number(root, "id", 0xFFFFFF)};
        std::set<std::string> keys;
        for (pugi::xml_node const parameter : Elements(root, "parameter"))
        {
            std::string const key = Key(parameter);
            if (!keys.insert(key).second)
                Fail(FileTrouble::RepeatedKey, parameter, key);
            TakeParameter(parameter, key);
        }
        result.ticket = m_content.Take();
        return result;
    }

private:
    [[noreturn]] void FailAtLine(FileTrouble trouble, std::optional<std::size_t> line,
                                 std::string_view detail) const
    {
        throw FaultThrown({trouble, m_file, line, {}, std::string(detail.substr(0, 40))});
    }

    [[noreturn]] void Fail(FileTrouble trouble, pugi::xml_node at, std::string_view detail) const
    {
        FailAtLine(trouble, LineOf(at.offset_debug()), detail);
    }

    std::size_t LineOf(std::ptrdiff_t offset) const
    {
        auto const end = std::clamp<std::ptrdiff_t>(offset, 0, static_cast<std::ptrdiff_t>(m_xml.size()));
        return 1 + static_cast<std::size_t>(std::count(m_xml.begin(), m_xml.begin() + end, '\n'));
    }

    // No byte of a longer character is a line feed, so that lines can be looked at one by one.
    void CheckCharacters() const
    {
        std::size_t number = 1;
        for (std::size_t begin = 0; begin <= m_xml.size(); ++number)
        {
            std::size_t const end = std::min(m_xml.find('\n', begin), m_xml.size());
            std::string_view const line = m_xml.substr(begin, end - begin);
            if (std::any_of(line.begin(), line.end(), IsControl))
                FailAtLine(FileTrouble::ControlCharacter, number, {});
            if (!IsAscii(line) && comgui::ToUtf8(comgui::ToWx(line)) != line)
                FailAtLine(FileTrouble::NotUtf8, number, {});
            begin = end + 1;
        }
    }

    // White space is none; the line is that of what comes behind it.
    void RefuseText(pugi::xml_node node) const
    {
        if (!IsText(node) || Trimmed(node.value()).empty())
            return;
        std::size_t const begin = static_cast<std::size_t>(std::max<std::ptrdiff_t>(node.offset_debug(), 0));
        std::size_t const text = std::min(m_xml.find_first_not_of(WhiteSpace, begin), m_xml.size());
        FailAtLine(FileTrouble::StrayText, LineOf(static_cast<std::ptrdiff_t>(text)), Trimmed(node.value()));
    }

    pugi::xml_node Root() const
    {
        pugi::xml_node root;
        for (pugi::xml_node const child : m_document)
        {
            if (child.type() == pugi::node_doctype)
                Fail(FileTrouble::DocumentType, child, child.value());
            RefuseText(child);
            if (child.type() != pugi::node_element)
                continue;
            if (root || child.name() != std::string_view("ticket"))
                Fail(FileTrouble::NotATicket, child, child.name());
            root = child;
        }
        if (!root)
            FailAtLine(FileTrouble::NotATicket, 1, {});
        return root;
    }

    // All of that name, and nothing else.
    std::vector<pugi::xml_node> Elements(pugi::xml_node node, std::string_view name) const
    {
        std::vector<pugi::xml_node> elements;
        for (pugi::xml_node const child : node)
        {
            if (child.type() == pugi::node_doctype)
                Fail(FileTrouble::DocumentType, child, child.value());
            RefuseText(child);
            if (child.type() == pugi::node_element && child.name() != name)
                Fail(FileTrouble::UnknownElement, child, child.name());
            if (child.type() == pugi::node_element)
                elements.push_back(child);
        }
        return elements;
    }

    void ExpectAttributes(pugi::xml_node node, std::initializer_list<std::string_view> known) const
    {
        std::vector<std::string_view> seen;
        for (pugi::xml_attribute const attribute : node.attributes())
        {
            std::string_view const name = attribute.name();
            if (std::find(known.begin(), known.end(), name) == known.end())
                Fail(FileTrouble::UnknownAttribute, node, name);
            if (std::find(seen.begin(), seen.end(), name) != seen.end())
                Fail(FileTrouble::RepeatedAttribute, node, name);
            seen.push_back(name);
        }
    }

    // A text with its references resolved.
    std::string Resolved(pugi::xml_node at, std::string_view text) const
    {
        std::string resolved;
        for (std::size_t begin = 0; begin < text.size();)
        {
            std::size_t const reference = std::min(text.find('&', begin), text.size());
            resolved += text.substr(begin, reference - begin);
            if (reference == text.size())
                break;
            std::size_t const end = std::min(text.find(';', reference), text.size());
            auto const character = CharacterOf(text.substr(reference + 1, end - reference - 1));
            if (!character || end == text.size())
                Fail(FileTrouble::BadReference, at, text.substr(reference));
            resolved += *character;
            begin = end + 1;
        }
        return resolved;
    }

    std::string Attribute(pugi::xml_node node, char const* name) const
    {
        pugi::xml_attribute const attribute = node.attribute(name);
        if (!attribute)
            Fail(FileTrouble::MissingAttribute, node, name);
        return Resolved(node, attribute.value());
    }

    int Number(pugi::xml_node node, char const* name, int highest) const
    {
        std::string const text = Attribute(node, name);
        auto const value = NumberOf(node, text, PARAM_INT);
        int const number = std::get<int>(value);
        if (number < 0 || number > highest)
            Fail(FileTrouble::OutOfRange, node, text);
        return number;
    }

    Value NumberOf(pugi::xml_node node, std::string_view text, PARAM_TYPE type) const
    {
        comgui::Result<Value> value = comgui::FromText(Trimmed(text), type);
        if (!value)
            Fail(value.GetError().code == comgui::OutOfRange ? FileTrouble::OutOfRange
                                                             : FileTrouble::NotANumber,
                 node, text);
        return *std::move(value);
    }

    // Whether an attribute says that something is written as base64.
    bool IsBase64(pugi::xml_node node, char const* attribute) const
    {
        if (!node.attribute(attribute))
            return false;
        if (Attribute(node, attribute) != "base64")
            Fail(FileTrouble::UnknownEncoding, node, Attribute(node, attribute));
        return true;
    }

    std::string Decoded(pugi::xml_node node, std::string_view text) const
    {
        if (Trimmed(text).empty())
            return {};
        wxMemoryBuffer const bytes = wxBase64Decode(text.data(), text.size(), wxBase64DecodeMode_SkipWS);
        if (bytes.GetDataLen() == 0)
            Fail(FileTrouble::NotBase64, node, text);
        return {static_cast<char const*>(bytes.GetData()), bytes.GetDataLen()};
    }

    std::string Key(pugi::xml_node node) const
    {
        ExpectAttributes(node, {"key", "key-encoding", "type", "encoding"});
        std::string key = Attribute(node, "key");
        if (IsBase64(node, "key-encoding"))
            key = Decoded(node, key);
        if (!FileContent::IsKey(key))
            Fail(FileTrouble::BadKey, node, key);
        return key;
    }

    PARAM_TYPE Type(pugi::xml_node node) const
    {
        std::string const name = Attribute(node, "type");
        for (TypeName const& known : TypeNames)
            if (known.name == name)
                return known.type;
        Fail(FileTrouble::UnknownType, node, name);
    }

    void TakeParameter(pugi::xml_node node, std::string const& key)
    {
        PARAM_TYPE const type = Type(node);
        if (!node.find_child([](pugi::xml_node child) { return child.type() == pugi::node_element; }))
            return Put(node, key, 0, type);
        if (node.attribute("encoding"))  // it would say nothing: each value has its own
            Fail(FileTrouble::UnknownAttribute, node, "encoding");
        std::set<int> positions;
        for (pugi::xml_node const value : Elements(node, "value"))
        {
            ExpectAttributes(value, {"pos", "type", "encoding"});
            int const pos = Number(value, "pos", LargestPosition);
            if (!positions.insert(pos).second)
                Fail(FileTrouble::RepeatedPosition, value, std::to_string(pos));
            Put(value, key, pos, value.attribute("type") ? Type(value) : type);
        }
    }

    void Put(pugi::xml_node node, std::string const& key, int pos, PARAM_TYPE type)
    {
        std::string const content = Content(node);
        bool const isBase64 = IsBase64(node, "encoding");
        if (type != PARAM_STRING && type != PARAM_BINSTRING)
        {
            if (isBase64)
                Fail(FileTrouble::UnknownEncoding, node, "base64");
            return Put(node, key, pos, NumberOf(node, content, type), 0);
        }
        std::string text = isBase64 || type == PARAM_BINSTRING ? Decoded(node, content) : content;
        std::size_t const size = text.size();
        if (type == PARAM_BINSTRING)
            return Put(node, key, pos, comgui::Bytes{std::move(text)}, size);
        if (text.find('\0') != std::string::npos)
            Fail(FileTrouble::BadText, node, key);
        Put(node, key, pos, std::move(text), size);
    }

    void Put(pugi::xml_node node, std::string const& key, int pos, Value value, std::size_t bytes)
    {
        if (!m_content.Put(key, pos, std::move(value), bytes))
            Fail(FileTrouble::TooLarge, node, {});
    }

    std::string Content(pugi::xml_node node) const
    {
        std::string content;
        for (pugi::xml_node const child : node)
        {
            if (!IsText(child))
                Fail(FileTrouble::UnknownElement, child, child.name());
            content += child.type() == pugi::node_cdata ? child.value() : Resolved(node, child.value());
        }
        return content;
    }

    std::string_view const m_xml;
    std::string const& m_file;
    pugi::xml_document m_document;
    FileContent m_content;
};
}  // namespace

FileResult<TicketOfFile> TicketOfXml(std::string_view xml, std::string const& file)
try
{
    return XmlReader(xml, file).Ticket();
}
catch (FaultThrown const& thrown)
{
    return thrown.Fault();
}
catch (std::bad_alloc const&)
{
    return FileFault{FileTrouble::NoMemory, file, {}, {}, {}};
}
}  // namespace desk
