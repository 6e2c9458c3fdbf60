// PARTIAL_MODE against a plain model: two lists of texts that are searched from end to end. The input is a
// text of one command a line:
//   +KEY inserts   -KEY erases   =KEY,KEY,... sets a table   ?KEY asks for one more key from here on
//   ! sets null    any other line clears
// After each line the mode and the model must agree about all keys that were named so far, and about what
// begins them.
#include "comgui/ticket/PARTIAL_MODE.h"

#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include "fuzz/fuzz.h"
#include <algorithm>
#include <set>
#include <vector>

namespace
{
class MODEL
{
public:
    void Insert(std::string const& key)
    {
        if (key.empty())
            return;
        if (!IsPrefix(key))
        {
            if (std::find(m_keys.begin(), m_keys.end(), key) == m_keys.end())
                m_keys.push_back(key);
            return;
        }
        // A narrower prefix goes, but only one; the new one comes only if nothing is left that overlaps it.
        std::string const prefix = key.substr(0, key.size() - 1);
        auto const overlapping = LowestOverlapping(prefix);
        if (overlapping != m_prefixes.end() && overlapping->size() > prefix.size())
            m_prefixes.erase(overlapping);
        if (LowestOverlapping(prefix) == m_prefixes.end())
            m_prefixes.push_back(prefix);
    }

    void Erase(std::string const& key)
    {
        if (!IsPrefix(key))
        {
            m_keys.erase(std::remove(m_keys.begin(), m_keys.end(), key), m_keys.end());
            return;
        }
        std::string const prefix = key.substr(0, key.size() - 1);
        auto const overlapping = LowestOverlapping(prefix);
        if (overlapping != m_prefixes.end() && overlapping->size() <= prefix.size())
            m_prefixes.erase(overlapping);
    }

    void Clear()
    {
        m_keys.clear();
        m_prefixes.clear();
    }

    bool Contains(std::string const& key) const
    {
        return std::find(m_keys.begin(), m_keys.end(), key) != m_keys.end() ||
               std::any_of(m_prefixes.begin(), m_prefixes.end(),
                           [&](auto const& prefix) { return key.substr(0, prefix.size()) == prefix; });
    }

    bool IsPartial() const { return !m_keys.empty() || !m_prefixes.empty(); }

private:
    static bool IsPrefix(std::string const& key) { return !key.empty() && key[key.size() - 1] == '*'; }

    // The lowest prefix that begins the text or is begun by it.
    std::vector<std::string>::iterator LowestOverlapping(std::string const& text)
    {
        auto lowest = m_prefixes.end();
        for (auto prefix = m_prefixes.begin(); prefix != m_prefixes.end(); ++prefix)
        {
            std::size_t const size = std::min(prefix->size(), text.size());
            if (prefix->substr(0, size) == text.substr(0, size) &&
                (lowest == m_prefixes.end() || *prefix < *lowest))
                lowest = prefix;
        }
        return lowest;
    }

    std::vector<std::string> m_keys;
    std::vector<std::string> m_prefixes;
};

std::vector<std::string> Split(std::string const& text, char separator)
{
    std::vector<std::string> parts;
    std::size_t from = 0;
    for (std::size_t end; (end = text.find(separator, from)) != std::string::npos; from = end + 1)
        parts.push_back(text.substr(from, end - from));
    parts.push_back(text.substr(from));
    return parts;
}

void Set(PARTIAL_MODE& mode, MODEL& model, std::vector<std::string> const& keys)
{
    std::vector<char const*> table;
    for (std::string const& key : keys)
        table.push_back(key.c_str());
    table.push_back(nullptr);
    mode.set(table.data());
    bool const isRemoval = keys[0].empty();
    for (std::string const& key : keys)
        isRemoval ? model.Erase(key) : model.Insert(key);
}

// Whether the action of a walk adds that key's parameter to its list.
template <typename ACTION>
bool Takes(ACTION& action, SETMULTIPAR_LIST const& list, std::string const& key)
{
    unsigned long const before = list.Size();
    COMGUI_MUST(ACTION::CollectAction(&action, key.c_str(), PARAM_STRING, "", -1));
    return list.Size() != before;
}
}  // namespace

int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    std::string program(reinterpret_cast<char const*>(data), std::min<std::size_t>(size, 300));
    std::replace(program.begin(), program.end(), '\0', '0');  // keys are C texts
    PARTIAL_MODE mode(nullptr);
    MODEL model;
    std::set<std::string> asked;
    for (std::string const& line : Split(program, '\n'))
    {
        std::string const key = line.substr(std::min<std::size_t>(line.size(), 1));
        std::vector<std::string> const keys = Split(key, ',');
        switch (line[0])
        {
        case '+':
            mode.insert(key);
            model.Insert(key);
            break;
        case '-':
            mode.erase(key);
            model.Erase(key);
            break;
        case '=':
            Set(mode, model, keys);
            break;
        case '?':
            break;
        case '!':
            mode.set(nullptr);
            model.Clear();
            break;
        default:
            mode.clear();
            model.Clear();
            break;
        }
        for (std::string const& named : keys)
            for (std::size_t length = 0; length <= named.size(); ++length)
                asked.insert(named.substr(0, length));
        COMGUI_MUST(mode.partial() == model.IsPartial());
        for (std::string const& text : asked)
            COMGUI_MUST(mode.multi_contains(text) == model.Contains(text));
    }
    SETMULTIPAR_LIST list(false);
    PARTIAL_COLLECT_ACTION selected(&list, mode);
    FILTERED_PARTIAL_COLLECT_ACTION others(&list, mode);
    for (std::string const& text : asked)
    {
        COMGUI_MUST(Takes(selected, list, text) == model.Contains(text));
        COMGUI_MUST(Takes(others, list, text) != model.Contains(text));
    }
    return 0;
}
