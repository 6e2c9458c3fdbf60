#include "tools/comgui_trace/CallText.h"

#include "tools/shared/text.h"
#include <array>
#include <cstdio>

namespace tracing
{
namespace
{
using tools::Colour;

constexpr std::array TypeNames = {"NONE",  "POINTER", "INT",   "DOUBLE",   "STRING",
                                  "BYTES", "COUNT",   "INT64", "UNSIGNED", "UNSIGNED64"};

std::string Printed(char const* form, auto... arguments)
{
    std::array<char, 64> text;
    std::snprintf(text.data(), text.size(), form, arguments...);
    return text.data();
}

std::string TextOfField(Field const& field, bool withAddresses)
{
    struct
    {
        bool withAddresses;

        std::string operator()(None) const { return "-"; }
        std::string operator()(Hidden) const { return "(hidden)"; }
        std::string operator()(Text const& text) const
        {
            std::string const shown = text.isBytes ? tools::ShownBytes(text.here) : tools::Shown(text.here);
            bool const isCut = text.length > text.here.size();
            return isCut ? shown + "... (" + std::to_string(text.length) + " bytes)" : shown;
        }
        std::string operator()(Address address) const
        {
            return withAddresses    ? Printed("0x%llx", static_cast<unsigned long long>(address.number))
                   : address.number ? "(address)"
                                    : "null";
        }
        std::string operator()(int number) const { return std::to_string(number); }
        std::string operator()(unsigned number) const { return std::to_string(number); }
        std::string operator()(long long number) const { return std::to_string(number); }
        std::string operator()(unsigned long long number) const { return std::to_string(number); }
        std::string operator()(double number) const { return tools::NumberText(number); }
    } const visitor{withAddresses};
    return std::visit(visitor, field);
}

// A type's number as its name.
std::string Named(std::string const& name, Field const& field, bool withAddresses)
{
    auto const* const number = std::get_if<int>(&field);
    if (name == "as" && number && *number >= 0 && *number < static_cast<int>(TypeNames.size()))
        return TypeNames[static_cast<std::size_t>(*number)];
    return TextOfField(field, withAddresses);
}

std::string List(char const* names, std::vector<Field> const& fields, bool withAddresses)
{
    auto const all = NamesIn(names);
    std::string text;
    for (std::size_t i = 0; i < fields.size(); ++i)
        text += (i ? ", " : "") + Named(i < all.size() ? all[i] : "", fields[i], withAddresses);
    return text;
}

char const* NamesOfDetail(trace::Call call)
{
    return call == trace::Call::MWalk ? "type,id" : "key,as,pos,ok,value";
}

std::string WholeText(TracedCall const& call, bool withAddresses)
{
    trace::CallText const& text = TextOf(call.began.head.call);
    std::string line =
        std::string(text.name) + "(" + List(text.arguments, call.began.fields, withAddresses) + ")";
    if (!call.hasEnded)
        return line + " never ended";
    return call.results.empty() ? line : line + " = " + List(text.results, call.results, withAddresses);
}

nlohmann::ordered_json JsonOf(Field const& field)
{
    struct
    {
        nlohmann::ordered_json operator()(None) const { return nullptr; }
        nlohmann::ordered_json operator()(Hidden) const { return {{"hidden", true}}; }
        nlohmann::ordered_json operator()(Text const& text) const
        {
            bool const isText = !text.isBytes && tools::Quoted(text.here);
            if (isText && text.length == text.here.size())
                return text.here;
            nlohmann::ordered_json json;
            json[isText ? "text" : "bytes"] = isText ? text.here : tools::Hex(text.here);
            json["length"] = text.length;
            return json;
        }
        nlohmann::ordered_json operator()(Address address) const
        {
            return Printed("0x%llx", static_cast<unsigned long long>(address.number));
        }
        nlohmann::ordered_json operator()(int number) const { return number; }
        nlohmann::ordered_json operator()(unsigned number) const { return number; }
        nlohmann::ordered_json operator()(long long number) const { return number; }
        nlohmann::ordered_json operator()(unsigned long long number) const { return number; }
        nlohmann::ordered_json operator()(double number) const { return number; }
    } const visitor;
    return std::visit(visitor, field);
}

nlohmann::ordered_json JsonOf(char const* names, std::vector<Field> const& fields)
{
    auto const all = NamesIn(names);
    nlohmann::ordered_json json = nlohmann::ordered_json::object();
    for (std::size_t i = 0; i < fields.size() && i < all.size(); ++i)
        json[all[i]] = JsonOf(fields[i]);
    return json;
}
}  // namespace

std::string DurationText(std::uint64_t nanoseconds)
{
    auto const number = static_cast<double>(nanoseconds);
    if (number < 1e3)
        return Printed("%.0f ns", number);
    if (number < 1e6)
        return Printed("%.3g us", number / 1e3);
    if (number < 1e9)
        return Printed("%.3g ms", number / 1e6);
    return Printed("%.3g s", number / 1e9);
}

std::string Line(TracedCall const& call, tools::Output const& out, bool withDetails)
{
    std::string const when = Printed("%12.6f", static_cast<double>(call.began.head.time) / 1e9);
    std::string const text = WholeText(call, true);
    std::string line = out.Painted(Colour::Quiet, when + Printed(" %7u  ", call.began.head.thread));
    line += call.hasEnded && call.isGood ? text : out.Painted(Colour::Bad, text);
    if (call.hasEnded)
        line += out.Painted(Colour::Quiet, "  " + DurationText(call.duration));
    line += '\n';
    if (withDetails)
        for (Record const& detail : call.details)
            line +=
                std::string(24, ' ') + List(NamesOfDetail(call.began.head.call), detail.fields, true) + '\n';
    return line;
}

nlohmann::ordered_json ToJson(TracedCall const& call)
{
    trace::CallText const& text = TextOf(call.began.head.call);
    nlohmann::ordered_json json;
    json["call"] = text.name;
    json["number"] = call.began.head.number;
    json["time"] = call.began.head.time;
    json["thread"] = call.began.head.thread;
    json["arguments"] = JsonOf(text.arguments, call.began.fields);
    for (Record const& detail : call.details)
        json["details"].push_back(JsonOf(NamesOfDetail(call.began.head.call), detail.fields));
    if (call.hasEnded)
    {
        json["results"] = JsonOf(text.results, call.results);
        json["nanoseconds"] = call.duration;
        json["good"] = call.isGood;
    }
    return json;
}

std::string Essence(TracedCall const& call)
{
    std::string text = WholeText(call, false);
    for (Record const& detail : call.details)
        text += "\n    " + List(NamesOfDetail(call.began.head.call), detail.fields, false);
    return text;
}
}  // namespace tracing
