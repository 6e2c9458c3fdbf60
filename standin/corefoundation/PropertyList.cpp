#include "standin/corefoundation/PropertyList.h"

#include "standin/corefoundation/Utf8.h"
#include <fstream>
#include <pugixml.hpp>
#include <regex>
#include <string_view>
#include <system_error>

namespace comgui::detail
{
namespace
{
namespace fs = std::filesystem;

// libplist recurses, and must not exhaust the stack. No Info.plist that means anything comes near these.
constexpr std::uintmax_t largestFile = 16UL * 1024 * 1024;
constexpr int deepestElement = 512;
constexpr std::uint64_t mostObjects = 8192;  // of a binary one, each of which may lie in the next

// Empty if there is no such file, or one that is too large.
std::string ContentOf(fs::path const& file)
{
    std::error_code error;
    if (!fs::is_regular_file(file, error) || fs::file_size(file, error) > largestFile || error)
        return {};  // a pipe would block
    std::ifstream stream(file, std::ios::binary);
    return {std::istreambuf_iterator<char>(stream), {}};
}

struct SoundElements : pugi::xml_tree_walker
{
    bool for_each(pugi::xml_node& node) override
    {
        static std::regex const date(R"(-?\d{4}-\d{2}-\d{2}T\d{2}:\d{2}:\d{2}Z)");
        return depth() <= deepestElement &&
               (std::string_view(node.name()) != "date" || std::regex_match(node.child_value(), date));
    }
};

// libplist takes what it can get, for instance half a file.
bool IsSoundXml(std::string_view content)
{
    pugi::xml_document document;
    SoundElements elements;
    return IsUtf8(content) &&
           document.load_buffer(content.data(), content.size(), pugi::parse_default, pugi::encoding_utf8) &&
           document.traverse(elements);
}

// The number of objects stands 24 bytes before the end, most significant byte first.
bool IsModestBinary(std::string_view content)
{
    constexpr std::size_t fromEnd = 24;
    std::uint64_t objects = 0;
    if (content.size() < fromEnd)
        return false;
    for (char const byte : content.substr(content.size() - fromEnd, sizeof objects))
        objects = objects << 8 | static_cast<unsigned char>(byte);
    return objects <= mostObjects;
}
}  // namespace

Plist ReadPropertyList(fs::path const& file)
{
    std::string const bytes = ContentOf(file);
    std::string_view content = bytes;
    plist_t root = nullptr;
    if (plist_is_binary(content.data(), static_cast<uint32_t>(content.size())))
    {
        if (IsModestBinary(content))
            plist_from_bin(content.data(), static_cast<uint32_t>(content.size()), &root);
        return Plist(root);
    }
    if (content.substr(0, ByteOrderMark.size()) == ByteOrderMark)
        content.remove_prefix(ByteOrderMark.size());
    if (IsSoundXml(content))
        plist_from_xml(content.data(), static_cast<uint32_t>(content.size()), &root);
    return Plist(root);
}
}  // namespace comgui::detail
