#include "standin/corefoundation/BundleInfo.h"

#include <cstdlib>
#include <fstream>
#include <memory>
#include <plist/plist.h>
#include <system_error>
#include <type_traits>
#include <utility>

namespace comgui::detail
{
namespace
{
namespace fs = std::filesystem;

// Far above any real Info.plist, and so low that the property list library, which recurses, cannot exhaust
// the stack by a deeply nested one.
constexpr std::uintmax_t largestInfo = 64UL * 1024;

struct PlistFree
{
    void operator()(plist_t node) const { plist_free(node); }
};
using Plist = std::unique_ptr<std::remove_pointer_t<plist_t>, PlistFree>;

struct MallocFree
{
    void operator()(void* block) const { std::free(block); }
};
template <class T>
using Malloced = std::unique_ptr<T, MallocFree>;

// The content of the file, the empty text if there is none that can be an Info.plist.
std::string ReadInfoFile(fs::path const& file)
{
    std::error_code error;
    if (!fs::is_regular_file(file, error))  // a pipe would block
        return {};
    std::ifstream stream(file, std::ios::binary);
    std::string content(largestInfo + 1, '\0');
    stream.read(content.data(), static_cast<std::streamsize>(content.size()));
    content.resize(static_cast<std::size_t>(stream.gcount()));
    return content.size() > largestInfo ? std::string() : content;
}

Plist ParsePlist(std::string const& content)
{
    auto const size = static_cast<uint32_t>(content.size());
    plist_t root = nullptr;
    if (plist_is_binary(content.data(), size))
        plist_from_bin(content.data(), size, &root);
    else
        plist_from_xml(content.data(), size, &root);
    return Plist(root);
}

std::optional<std::string> TextOf(plist_t node)
{
    if (node == nullptr || plist_get_node_type(node) != PLIST_STRING)
        return std::nullopt;
    uint64_t length = 0;
    char const* const text = plist_get_string_ptr(node, &length);
    return text ? std::optional(std::string(text, length)) : std::nullopt;
}

// Calls visit(uuid, value) for each entry of the dictionary whose key is a UUID.
template <class VISIT>
void ForEachUuid(plist_t dictionary, VISIT visit)
{
    plist_dict_iter raw = nullptr;
    plist_dict_new_iter(dictionary, &raw);
    Malloced<void> const iterator(raw);
    for (;;)
    {
        char* key = nullptr;
        plist_t value = nullptr;
        plist_dict_next_item(dictionary, iterator.get(), &key, &value);
        Malloced<char> const keyOwner(key);
        if (key == nullptr || value == nullptr)
            return;
        if (auto const uuid = ParseUuid(key))
            visit(*uuid, value);
    }
}

std::vector<Uuid> UuidsOf(plist_t array)
{
    std::vector<Uuid> uuids;
    plist_array_iter raw = nullptr;
    plist_array_new_iter(array, &raw);
    Malloced<void> const iterator(raw);
    for (;;)
    {
        plist_t item = nullptr;
        plist_array_next_item(array, iterator.get(), &item);
        if (item == nullptr)
            return uuids;
        auto const text = TextOf(item);
        if (auto const uuid = ParseUuid(text.value_or("")))
            uuids.push_back(*uuid);
    }
}

bool IsDictionary(plist_t node) { return node != nullptr && plist_get_node_type(node) == PLIST_DICT; }

bool IsFileName(std::string const& name)
{
    return name != "." && name != ".." && name.find('/') == std::string::npos &&
           name.find('\0') == std::string::npos;
}

// Empty where a path would lead out of the bundle.
std::string ExecutableOf(plist_t root, fs::path const& bundle)
{
    std::string const name = TextOf(plist_dict_get_item(root, "CFBundleExecutable")).value_or("");
    if (!name.empty())
        return IsFileName(name) ? name : std::string();
    fs::path const folder = (bundle / "").lexically_normal().parent_path();  // without a slash or dot behind
    return folder.stem().string();
}

std::map<Uuid, std::string> FunctionsOf(plist_t root)
{
    std::map<Uuid, std::string> functions;
    plist_t const entries = plist_dict_get_item(root, "CFPlugInFactories");
    if (IsDictionary(entries))
    {
        ForEachUuid(entries,
                    [&](Uuid const& factory, plist_t value)
                    {
                        if (auto const function = TextOf(value))
                            functions.emplace(factory, *function);
                    });
    }
    return functions;
}

std::map<Uuid, std::vector<Uuid>> FactoriesOf(plist_t root, std::map<Uuid, std::string> const& functions)
{
    std::map<Uuid, std::vector<Uuid>> factories;
    plist_t const entries = plist_dict_get_item(root, "CFPlugInTypes");
    if (IsDictionary(entries))
    {
        ForEachUuid(entries,
                    [&](Uuid const& type, plist_t value)
                    {
                        if (plist_get_node_type(value) != PLIST_ARRAY)
                            return;
                        auto uuids = UuidsOf(value);
                        std::erase_if(uuids, [&](Uuid const& uuid) { return !functions.contains(uuid); });
                        factories.emplace(type, std::move(uuids));
                    });
    }
    return factories;
}
}  // namespace

std::optional<BundleInfo> ReadBundleInfo(fs::path const& bundle)
{
    Plist const root = ParsePlist(ReadInfoFile(bundle / "Contents" / "Info.plist"));
    if (!IsDictionary(root.get()))
        return std::nullopt;
    BundleInfo info;
    info.executable = ExecutableOf(root.get(), bundle);
    info.functions = FunctionsOf(root.get());
    info.factories = FactoriesOf(root.get(), info.functions);
    return info;
}
}  // namespace comgui::detail
