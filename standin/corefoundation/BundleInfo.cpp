#include "standin/corefoundation/BundleInfo.h"

#include "standin/corefoundation/PropertyList.h"
#include <cstdlib>
#include <memory>
#include <utility>

namespace comgui::detail
{
namespace
{
namespace fs = std::filesystem;

struct MallocFree
{
    void operator()(void* block) const { std::free(block); }
};
template <class T>
using Malloced = std::unique_ptr<T, MallocFree>;

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

bool IsListOrText(plist_t node)
{
    return plist_get_node_type(node) == PLIST_ARRAY || plist_get_node_type(node) == PLIST_STRING;
}

// Of an array of texts, or of a single text.
std::vector<Uuid> UuidsOf(plist_t value)
{
    std::vector<Uuid> uuids;
    auto const add = [&](plist_t item)
    {
        if (auto const uuid = ParseUuid(TextOf(item).value_or("")))
            uuids.push_back(*uuid);
    };
    if (plist_get_node_type(value) != PLIST_ARRAY)
    {
        add(value);
        return uuids;
    }
    plist_array_iter raw = nullptr;
    plist_array_new_iter(value, &raw);
    Malloced<void> const iterator(raw);
    for (;;)
    {
        plist_t item = nullptr;
        plist_array_next_item(value, iterator.get(), &item);
        if (item == nullptr)
            return uuids;
        add(item);
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
    plist_t entries = plist_dict_get_item(root, "CFPlugInFactories");
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
    plist_t entries = plist_dict_get_item(root, "CFPlugInTypes");
    if (IsDictionary(entries))
    {
        ForEachUuid(entries,
                    [&](Uuid const& type, plist_t value)
                    {
                        if (!IsListOrText(value))
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
    Plist const root = ReadPropertyList(bundle / "Contents" / "Info.plist");
    if (!IsDictionary(root.get()))
        return std::nullopt;
    BundleInfo info;
    info.executable = ExecutableOf(root.get(), bundle);
    info.functions = FunctionsOf(root.get());
    info.factories = FactoriesOf(root.get(), info.functions);
    return info;
}
}  // namespace comgui::detail
