#include "FormValue.h"

#include "Shown.h"

using namespace comgui;

PARAM_TYPE TypeOf(std::string const& name)
{
    std::string names;
    for (PARAM_TYPE const type :
         {PARAM_INT, PARAM_DOUBLE, PARAM_STRING, PARAM_INT64, PARAM_UNSIGNED, PARAM_UNSIGNED64})
    {
        if (name == NameOf(type))
            return type;
        names += (names.empty() ? "" : ", ") + std::string(NameOf(type));
    }
    throw Refusal("there is no type \"" + name + "\"; the types are " + names);
}

std::pair<std::string, std::string> SplitField(std::string const& field)
{
    std::size_t const equals = field.find('=');
    if (equals == std::string::npos || equals == 0)
        throw Refusal("\"" + field + "\" is not KEY=VALUE");
    return {field.substr(0, equals), field.substr(equals + 1)};
}

Value ValueOf(std::string const& key, std::string const& text, PARAM_TYPE type, PARAM_TYPE elementType)
{
    auto value = FromText(text, type, elementType);
    if (!value)
        throw Refusal(key + ": " + value.GetError().Text());
    // Tickets hold others, but who reads them as JSON finds something else.
    if (Json const json = ToJson(*value); Json::parse(Line(json)) != json)
        throw Refusal(key + ": " + text + ": this is neither a finite number nor a text in UTF-8");
    return *std::move(value);
}

Json ToJson(Value const& value)
{
    return std::visit(
        [&value](auto const& held) -> Json
        {
            using Held = std::decay_t<decltype(held)>;
            if constexpr (std::is_same_v<Held, std::monostate>)
                return nullptr;
            else if constexpr (std::is_same_v<Held, List>)
            {
                Json all = Json::array();
                for (Element const& element : held)
                    all[static_cast<std::size_t>(element.pos)] = ToJson(element.value);  // null before it
                return all;
            }
            else if constexpr (std::is_arithmetic_v<Held>)
                return held;
            else
                return ToText(value);
        },
        static_cast<Value::variant const&>(value));
}

std::string Line(Json const& value)
{
    return Shown(value.dump(-1, ' ', false, Json::error_handler_t::replace));
}
