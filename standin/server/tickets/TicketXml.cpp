#include "standin/server/tickets/TicketXml.h"

#include "standin/server/files/AtomicFile.h"
#include "standin/server/files/Report.h"
#include "standin/server/tickets/TicketXmlReader.h"
#include "standin/server/tickets/TicketXmlText.h"
#include <charconv>
#include <cmath>
#include <pugixml.hpp>
#include <sstream>

namespace standin
{
namespace
{
// Line ends other than a line feed change when XML is read, and all white space may in an attribute.
bool NeedsBase64(std::string_view text, char const* unsafe)
{
    return FirstForbiddenInXml(text) != std::string_view::npos ||
           text.find_first_of(unsafe) != std::string_view::npos;
}

std::string TextOf(double number)
{
    if (std::isnan(number))
        return "nan";
    char text[32];
    return {text, std::to_chars(text, text + sizeof(text), number).ptr};
}

std::string TextOf(StoredValue const& value)
{
    switch (value.type)
    {
    case PARAM_DOUBLE:
        return TextOf(value.number);
    case PARAM_UNSIGNED64:
        return std::to_string(static_cast<unsigned long long>(value.integer));
    default:
        return std::to_string(value.integer);
    }
}

void SetContent(pugi::xml_node node, StoredValue const& value)
{
    std::string text;
    if (value.type != PARAM_STRING && value.type != PARAM_BINSTRING)
        text = TextOf(value);
    else if (value.type == PARAM_STRING && !NeedsBase64(value.bytes, "\r"))
        text = value.bytes;
    else
    {
        text = EncodeBase64(value.bytes);
        if (value.type == PARAM_STRING)
            node.append_attribute("encoding") = "base64";
    }
    if (!text.empty())
        node.append_child(pugi::node_pcdata).set_value(text.c_str());
}

void SetKey(pugi::xml_node node, std::string const& key)
{
    bool const isBase64 = NeedsBase64(key, "\r\n\t");
    node.append_attribute("key") = (isBase64 ? EncodeBase64(key) : key).c_str();
    if (isBase64)
        node.append_attribute("key-encoding") = "base64";
}
}  // namespace

TicketXml TicketXml::Read(std::filesystem::path const& file)
{
    return Parse(ReadFile(file, SizeLimit + 1), file.string());
}

TicketXml TicketXml::Parse(std::string_view text, std::string const& name)
{
    TicketXmlReader const reader(text, name);
    return reader.Ticket(reader.Root("ticket"));
}

void TicketXml::Write(std::filesystem::path const& file) const
{
    std::string const text = Text();
    if (text.size() > SizeLimit)
        throw FileError(ForMessages(file.string()) + ": cannot be written: the ticket takes more than " +
                        std::to_string(SizeLimit >> 20) + " MiB; delete values, then try again");
    ReplaceFile(file, text);
}

TicketXml TicketXml::Of(std::optional<TicketAddress> address, TicketSnapshot const& ticket,
                        KeyFilter const* limit)
{
    TicketXml xml;
    xml.address = address;
    ticket.ForEachKey(
        [&](KeyValues const& values)
        {
            if (limit && !limit->Selects(values.Name()->Text()))
                return;
            for (TicketElement const& element : values.Elements())
                xml.Put(values.Name()->Text(), element.pos, element.ToStored());
        });
    return xml;
}

std::string TicketXml::Text() const
{
    pugi::xml_document document;
    pugi::xml_node declaration = document.append_child(pugi::node_declaration);
    declaration.append_attribute("version") = "1.0";
    declaration.append_attribute("encoding") = "UTF-8";
    pugi::xml_node ticket = document.append_child("ticket");
    ticket.append_attribute("version") = 1;
    if (address)
    {
        ticket.append_attribute("type") = address->type;
        ticket.append_attribute("id") = address->id;
    }
    for (auto const& [key, values] : m_parameters)
    {
        PARAM_TYPE const type = values.begin()->second.plain.type;
        pugi::xml_node parameter = ticket.append_child("parameter");
        SetKey(parameter, key);
        parameter.append_attribute("type") = XmlNameOf(type);
        bool const isSingle = values.size() == 1 && values.begin()->first == 0;
        for (auto const& [pos, value] : values)
        {
            pugi::xml_node const node = isSingle ? parameter : parameter.append_child("value");
            if (!isSingle)
                pugi::xml_node(node).append_attribute("pos") = pos;
            if (value.plain.type != type)
                pugi::xml_node(node).append_attribute("type") = XmlNameOf(value.plain.type);
            SetContent(node, value.View());
        }
    }
    std::ostringstream text;
    document.save(text, "    ", pugi::format_indent, pugi::encoding_utf8);
    return std::move(text).str();
}

void TicketXml::Put(std::string_view key, int pos, StoredValue const& value)
{
    if (XmlNameOf(value.type) != nullptr)
    {
        Value kept{value, std::string(value.bytes)};
        kept.plain.bytes = {};
        m_parameters[std::string(key)].insert_or_assign(pos, std::move(kept));
        return;
    }
    auto const found = m_parameters.find(key);
    if (found == m_parameters.end())
        return;
    found->second.erase(pos);
    if (found->second.empty())
        m_parameters.erase(found);
}

void TicketXml::Walk(
    std::function<void(std::string_view key, int pos, StoredValue const& value)> const& take) const
{
    for (auto const& [key, values] : m_parameters)
        for (auto const& [pos, value] : values)
            take(key, pos, value.View());
}

StoredValue TicketXml::Value::View() const
{
    StoredValue view = plain;
    view.bytes = bytes;
    return view;
}
}  // namespace standin
