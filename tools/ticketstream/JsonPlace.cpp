#include "tools/ticketstream/JsonPlace.h"

#include "tools/ticketstream/Trouble.h"
#include "tools/ticketstream/text.h"
#include <algorithm>
#include <string_view>

namespace ticketstream
{
namespace
{
struct MemberRule
{
    Part owner;
    Part part;
    char const* name;
};
constexpr MemberRule Rules[] = {
    {Part::Document, Part::Scalar, "stream"},
    {Part::Document, Part::Records, "records"},
    {Part::Document, Part::Operations, "operations"},
    {Part::Operation, Part::Scalar, "ticketType"},
    {Part::Operation, Part::Scalar, "ticketId"},
    {Part::Operation, Part::Scalar, "operation"},
    {Part::Operation, Part::Records, "records"},
    {Part::Operation, Part::Keys, "keys"},
    {Part::Operation, Part::Bytes, "payload"},
    {Part::Record, Part::Bytes, "key"},
    {Part::Record, Part::Scalar, "type"},
    {Part::Record, Part::Scalar, "pos"},
    {Part::Record, Part::Bytes, "value"},
    {Part::Bytes, Part::Scalar, "hex"},
};

MemberRule const* RuleOf(Part owner, std::string_view name)
{
    auto const* const found =
        std::find_if(std::begin(Rules), std::end(Rules),
                     [&](MemberRule const& rule) { return rule.owner == owner && rule.name == name; });
    return found == std::end(Rules) ? nullptr : found;
}

std::string MembersOf(Part owner)
{
    std::string names;
    for (MemberRule const& rule : Rules)
        if (rule.owner == owner)
            names += (names.empty() ? "\"" : ", \"") + std::string(rule.name) + '"';
    return names;
}

bool IsList(Part part) { return part == Part::Records || part == Part::Operations || part == Part::Keys; }

char const* Needed(Part part)
{
    if (IsList(part))
        return "a list is needed here";
    return part == Part::Scalar ? "a number or a text is needed here" : "an object is needed here";
}
}  // namespace

Part JsonPlace::Expected() const
{
    if (m_levels.empty())
        return Part::Document;
    Level const& level = m_levels.back();
    switch (level.part)
    {
    case Part::Records:
        return Part::Record;
    case Part::Operations:
        return Part::Operation;
    case Part::Keys:
        return Part::Bytes;
    default:
        return RuleOf(level.part, level.member)->part;
    }
}

void JsonPlace::Begin(bool isArray)
{
    Part const part = Expected();
    if (part == Part::Scalar || IsList(part) != isArray)
        throw WrongJson(Text(), Needed(part));
    m_levels.push_back({part, isArray});
}

Part JsonPlace::End()
{
    Part const part = m_levels.back().part;
    m_levels.pop_back();
    return part;
}

void JsonPlace::Next()
{
    if (!m_levels.empty() && m_levels.back().isArray)
        ++m_levels.back().index;
}

void JsonPlace::Scalar()
{
    Part const part = Expected();
    if (part != Part::Scalar && part != Part::Bytes)
        throw WrongJson(Text(), Needed(part));
}

void JsonPlace::Member(std::string const& name)
{
    Level& level = m_levels.back();
    MemberRule const* const rule = RuleOf(level.part, name);
    level.member = nullptr;  // an unknown one is a matter of the object
    if (rule == nullptr)
        throw WrongJson(Text(), "unknown member " + Shown(name, 40) + "; known are " + MembersOf(level.part));
    level.member = rule->name;
    unsigned int const bit = 1u << (rule - Rules);
    if ((level.given & bit) != 0)
        throw WrongJson(Text(), "given twice");
    level.given |= bit;
}

std::string JsonPlace::Text() const
{
    std::string text;
    for (Level const& level : m_levels)
        if (level.isArray)
            text += '/' + std::to_string(level.index);
        else if (level.member != nullptr)
            text += std::string("/") + level.member;
    return text;
}
}  // namespace ticketstream
