// What a file's reader has found so far: values by key and position, within bounds, so that a small file
// cannot become an endless ticket. For one thread at a time.
#pragma once

#include "comgui/client/Snapshot.h"
#include "comgui/client/Value.h"
#include <cstddef>
#include <map>
#include <string>
#include <string_view>
#include <tuple>
#include <utility>
#include <vector>

namespace desk
{
constexpr std::size_t LargestFile = std::size_t{64} << 20;      // bytes; what the server's own files may have
constexpr std::size_t LargestContent = std::size_t{512} << 20;  // bytes in memory, roughly
constexpr std::size_t LongestKey = std::size_t{64} << 10;       // bytes
constexpr int LargestPosition = 0xFFFFFF;                       // of a value in a list

class FileContent
{
public:
    FileContent() = default;
    FileContent(FileContent const&) = delete;
    FileContent& operator=(FileContent const&) = delete;

    // Whether a key is one that a ticket may have.
    static bool IsKey(std::string_view key)
    {
        return !key.empty() && key.size() <= LongestKey && key.find('\0') == std::string_view::npos;
    }

    // Replaces what stood there. bytes: of the value. False if that is too much.
    [[nodiscard]] bool Put(std::string const& key, int pos, comgui::Value value, std::size_t bytes)
    {
        constexpr std::size_t Node = 160;  // of a value in its map
        m_size += Node + bytes;
        if (m_last == m_keys.end() || m_last->first != key)
        {
            bool isNew = false;
            std::tie(m_last, isNew) = m_keys.try_emplace(key);
            m_size += isNew ? Node + key.size() : 0;
        }
        // Nearly always the last position so far, which is quick.
        m_last->second.insert_or_assign(m_last->second.end(), pos, std::move(value));
        return m_size <= LargestContent;
    }

    // A value alone at position 0 is no list. Leaves nothing here.
    comgui::Snapshot Take()
    {
        std::vector<comgui::SnapshotEntry> entries;
        entries.reserve(m_keys.size());
        m_last = m_keys.end();
        while (!m_keys.empty())
        {
            auto node = m_keys.extract(m_keys.begin());
            entries.push_back({std::move(node.key()), ValueOf(std::move(node.mapped()))});
        }
        return comgui::Snapshot(std::move(entries));
    }

private:
    static comgui::Value ValueOf(std::map<int, comgui::Value> values)
    {
        if (values.size() == 1 && values.begin()->first == 0)
            return std::move(values.begin()->second);
        comgui::List list;
        list.reserve(values.size());
        for (auto& [pos, value] : values)
            list.push_back({pos, std::move(value)});
        return list;
    }

    using Keys = std::map<std::string, std::map<int, comgui::Value>>;

    Keys m_keys;
    Keys::iterator m_last = m_keys.end();  // the key of the value before
    std::size_t m_size = 0;
};
}  // namespace desk
