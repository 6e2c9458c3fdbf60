// Addresses, values, times and sizes as texts: for people without any control character, and for JSON.
#pragma once

#include "standin/server/tickets/StoredValue.h"
#include "standin/server/tickets/TicketAddress.h"
#include <nlohmann/json.hpp>
#include <optional>
#include <string>
#include <string_view>

namespace comgui_site
{
using Json = nlohmann::ordered_json;

// UTF-8 without control characters, those of U+0080 to U+009F included, which some terminals obey.
bool IsPlain(std::string_view text);

// The text with \xNN in the place of every byte that makes it not plain. Never longer than four times as
// many.
std::string Cleaned(std::string_view text);

std::string TextOf(standin::TicketAddress address);         // "3/12"
char const* NameOfType(int type);                           // "jobs"; "" for a type without a name
std::string TimeText(long long secondsSince1970);           // local, "2024-05-17 09:30:00"
std::string SizeText(unsigned long long bytes);             // "1.5 MB"
std::string Counted(std::size_t number, char const* noun);  // "1 ticket", "2 tickets"

// "TYPE" gives only the type, "TYPE/ID" both; nothing for another text and for what no ticket can have.
struct TicketChoice
{
    int type = 0;
    std::optional<int> id{};
};
std::optional<TicketChoice> ChoiceOf(std::string_view text);

// A key, in quotes if it could be taken for something else; a value, cut if it is longer than the limit.
std::string ShownKey(std::string_view key);
std::string ShownValue(standin::StoredValue const& value, std::size_t limit = 60);

// Adds type and value to an object: "value", or "hex" for bytes and for a text that is not UTF-8.
void AddValue(Json& object, standin::StoredValue const& value);

// A text of whatever bytes as JSON: bytes that are not UTF-8 as Cleaned has them.
Json JsonOf(std::string_view text);

// One line, or indented ones. ASCII, so that no terminal obeys it.
std::string LineOf(Json const& json);
std::string LinesOf(Json const& json);
}  // namespace comgui_site
