// Values of tickets as they stand on a command line, and in JSON.
#pragma once

#include <comgui/client.h>
#include <nlohmann/json.hpp>
#include <stdexcept>
#include <string>
#include <type_traits>
#include <utility>

// What was asked for cannot be: no such ticket or key, a value that does not fit, a write that was refused.
struct Refusal : std::runtime_error
{
    using std::runtime_error::runtime_error;
};

// What a call has given; throws a Refusal if it has failed.
template <typename T>
T Given(comgui::Result<T> result)
{
    if (!result)
        throw Refusal(result.GetError().Text());
    if constexpr (!std::is_void_v<T>)
        return *std::move(result);
}

// The type of that name; throws a Refusal that tells the names.
PARAM_TYPE TypeOf(std::string const& name);

// Key and value; throws a Refusal if there is no = or no key.
std::pair<std::string, std::string> SplitField(std::string const& field);

// The value of a key, as a user has typed it; throws a Refusal if the text is none of the type. PARAM_COUNT:
// a list of that elementType.
comgui::Value ValueOf(std::string const& key, std::string const& text, PARAM_TYPE type,
                      PARAM_TYPE elementType);

using Json = nlohmann::ordered_json;

// Null for none, and for the gaps of a list; bytes and pointers as the kit's text.
Json ToJson(comgui::Value const& value);

// As JSON on one line, harmless on a terminal, whatever bytes the texts have.
std::string Line(Json const& value);
