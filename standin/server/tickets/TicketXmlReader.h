// The reading half of the XML files, shared by the ticket file and the seed: a parsed text that knows where
// everything stands, and refuses what it does not know instead of passing it over.
#pragma once

#include "standin/server/tickets/TicketXml.h"
#include <initializer_list>
#include <optional>
#include <pugixml.hpp>
#include <string>
#include <string_view>
#include <vector>

namespace standin
{
class TicketXmlReader
{
public:
    // name is what stands before the line in a message. The text is borrowed.
    TicketXmlReader(std::string_view text, std::string name);

    // The one element of the whole text, of that name and of version 1.
    pugi::xml_node Root(char const* name) const;

    // The elements in an element; text between them is refused.
    std::vector<pugi::xml_node> Elements(pugi::xml_node node) const;

    void ExpectNothingIn(pugi::xml_node node) const;

    // Each attribute is known and stands once.
    void ExpectAttributes(pugi::xml_node node, std::initializer_list<std::string_view> known) const;
    std::string Attribute(pugi::xml_node node, char const* name) const;  // must be there
    int Number(pugi::xml_node node, char const* name, int highest) const;

    // A <ticket>, whose attributes may include version.
    TicketXml Ticket(pugi::xml_node node) const;

    [[noreturn]] void Fail(pugi::xml_node node, std::string const& reason) const;

private:
    [[noreturn]] void FailAt(std::size_t offset, std::string const& reason) const;
    void Parameter(TicketXml& ticket, pugi::xml_node node) const;
    std::string Key(pugi::xml_node node) const;
    void Value(TicketXml& ticket, std::string const& key, int pos, PARAM_TYPE type,
               pugi::xml_node node) const;
    PARAM_TYPE Type(pugi::xml_node node) const;
    std::string String(pugi::xml_node node, PARAM_TYPE type) const;
    std::string Content(pugi::xml_node node) const;
    std::string Decoded(pugi::xml_node node, std::string const& text) const;

    std::string_view m_text;
    std::string m_name;
    pugi::xml_document m_document;
};

// The name of a type in the files, and back; null and PARAM_NONE where there is none.
char const* XmlNameOf(PARAM_TYPE type);
PARAM_TYPE TypeOfXmlName(std::string_view name);
}  // namespace standin
