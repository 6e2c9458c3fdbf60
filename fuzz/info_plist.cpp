// The Info.plist of a plug-in's bundle. Any bytes: what is accepted names a plain file as its executable, or
// none, and comes back when it is written as a property list. Any choices of entries, good and bad: what is
// read is what the good ones say, in their order.
#include "standin/corefoundation/BundleInfo.h"

#include "fuzz/fuzz.h"
#include "tests/server/MemoryFolder.h"
#include "tests/support/BundleOnDisk.h"
#include <set>

using comgui::detail::BundleInfo;
using comgui::detail::Uuid;

namespace
{
std::optional<BundleInfo> Read(std::string_view content)
{
    static MemoryFolder const folder;
    static BundleOnDisk const bundle(folder.Path());
    bundle.WriteInfo(content);
    return comgui::detail::ReadBundleInfo(bundle.Path());
}

bool AreEqual(BundleInfo const& left, BundleInfo const& right)
{
    return left.executable == right.executable && left.functions == right.functions &&
           left.factories == right.factories;
}

std::string TextOf(Uuid const& uuid)
{
    std::string text;
    for (auto const byte : uuid)
    {
        if (text.size() == 8 || text.size() == 13 || text.size() == 18 || text.size() == 23)
            text += '-';
        text += "0123456789ABCDEF"[byte >> 4];
        text += "0123456789abcdef"[byte & 15];
    }
    return text;
}

std::string Element(std::string const& name, std::string const& content)
{
    return "<" + name + ">" + content + "</" + name + ">";
}

std::string Text(std::string const& name, std::string const& text)
{
    std::string escaped;
    for (char const byte : text)
        escaped += byte == '&' ? "&amp;" : byte == '<' ? "&lt;" : byte == '>' ? "&gt;" : std::string(1, byte);
    return Element(name, escaped);
}

std::string Entry(std::string const& key, std::string const& value) { return Text("key", key) + value; }

std::string Document(std::string const& executable, std::string const& functions, std::string const& types)
{
    return Element("plist", Element("dict", Entry("CFBundleExecutable", executable) +
                                                Entry("CFPlugInFactories", Element("dict", functions)) +
                                                Entry("CFPlugInTypes", Element("dict", types))));
}

std::string Written(BundleInfo const& info)
{
    std::string functions;
    for (auto const& [factory, function] : info.functions)
        functions += Entry(TextOf(factory), Text("string", function));
    std::string types;
    for (auto const& [type, factories] : info.factories)
    {
        std::string array;
        for (Uuid const& factory : factories)
            array += Text("string", TextOf(factory));
        types += Entry(TextOf(type), Element("array", array));
    }
    return Document(Text("string", info.executable), functions, types);
}

// A text that a property list of either form carries as it is.
bool IsPlain(std::string const& text)
{
    return std::all_of(text.begin(), text.end(), [](char byte) { return byte > ' ' && byte < '\x7F'; });
}

bool IsPlain(BundleInfo const& info)
{
    return IsPlain(info.executable) &&
           std::all_of(info.functions.begin(), info.functions.end(),
                       [](auto const& entry) { return !entry.second.empty() && IsPlain(entry.second); });
}

void AsFile(std::string_view content)
{
    auto const info = Read(content);
    if (!info)
        return;
    std::string const& name = info->executable;
    COMGUI_MUST(name != "." && name != "..");
    COMGUI_MUST(name.find('/') == std::string::npos && name.find('\0') == std::string::npos);
    if (name.empty() || !IsPlain(*info))
        return;
    auto const again = Read(Written(*info));
    COMGUI_MUST(again && AreEqual(*again, *info));
}

// Names without what some writers trim or merge.
std::string NextName(INPUT& input)
{
    std::string name = "f";
    for (char const byte : input.Bytes(input.Among(6)))
        name += "abcXYZ019_&<>-.@"[static_cast<unsigned char>(byte) % 16];
    return name;
}

// A UUID's text, mostly a good one: then uuid is filled in.
std::string NextUuid(INPUT& input, std::optional<Uuid>& uuid)
{
    Uuid bytes{};
    bytes[0] = input.Take<std::uint8_t>() % 4;
    bytes[15] = input.Take<std::uint8_t>();
    std::string text = TextOf(bytes);
    switch (input.Among(8))
    {
    case 0:
        return text + "0";
    case 1:
        return text.substr(1);
    case 2:
        text[8] = '0';
        return text;
    case 3:
        text[input.Among(8)] = "gG-/:@`\x7E"[input.Among(8)];
        return text;
    default:
        uuid = bytes;
        return text;
    }
}

void AsEntries(INPUT input)
{
    BundleInfo expected;
    expected.executable = NextName(input);
    std::string functions;
    std::string types;
    std::set<std::string> keys;
    for (int entries = 0; entries < 20 && !input.IsEmpty(); ++entries)
    {
        std::optional<Uuid> uuid;
        bool const isType = input.Among(2) == 1;
        std::string const key = NextUuid(input, uuid);
        if (!keys.insert((isType ? "type " : "factory ") + key).second)
            continue;
        bool const isOfTheTypeDue = input.Among(4) != 0;
        if (!isType)
        {
            std::string const function = NextName(input);
            functions += Entry(key, isOfTheTypeDue ? Text("string", function) : "<integer>7</integer>");
            if (uuid && isOfTheTypeDue)
                expected.functions.emplace(*uuid, function);
            continue;
        }
        std::string array;
        std::vector<Uuid> factories;
        for (unsigned count = input.Among(4); count > 0; --count)
        {
            std::optional<Uuid> factory;
            array += Text("string", NextUuid(input, factory));
            if (factory)
                factories.push_back(*factory);
        }
        bool const isSingle = factories.size() == 1 && input.Among(2) == 1;
        if (isSingle && isOfTheTypeDue)
            array = Text("string", TextOf(factories[0]));
        types += Entry(key, isSingle && isOfTheTypeDue
                                ? array
                                : Element(isOfTheTypeDue ? "array" : "dict", isOfTheTypeDue ? array : ""));
        if (uuid && isOfTheTypeDue)
            expected.factories.emplace(*uuid, factories);
    }
    for (auto& type : expected.factories)
        std::erase_if(type.second,
                      [&](Uuid const& factory) { return !expected.functions.contains(factory); });
    auto const info = Read(Document(Text("string", expected.executable), functions, types));
    COMGUI_MUST(info && AreEqual(*info, expected));
}
}  // namespace

int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    AsFile({reinterpret_cast<char const*>(data), size});
    AsEntries({data, size});
    return 0;
}
