#include "comgui/ticket/PARTIAL_MODE.h"

#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include <utility>

// The elements that text begins stand in a row, and the set finds the lowest. An element that begins text is
// alone: its row would hold what begins with it.
STRINGPREFIXSET::const_iterator STRINGPREFIXSET::find(std::string const& text) const
{
    auto const found = m_prefixes.find(text);
    return found == end() || found->size() <= text.size() ? found : end();
}

bool STRINGPREFIXSET::Covers(std::string_view text) const
{
    auto const found = m_prefixes.find(text);
    return found != end() && found->size() <= text.size();
}

void STRINGPREFIXSET::insert(std::string const& text)
{
    // One narrower prefix makes way, and no more: what others cover stays as it was agreed upon.
    auto const found = m_prefixes.find(text);
    if (found != end() && found->size() > text.size())
        m_prefixes.erase(found);
    m_prefixes.insert(text);
}

std::size_t STRINGPREFIXSET::erase(std::string const& text)
{
    auto const found = find(text);
    if (found == end())
        return 0;
    m_prefixes.erase(found);
    return 1;
}

PARTIAL_MODE::PARTIAL_MODE(char const* const* keys)
{
    if (keys)
        set(keys);
}

PARTIAL_MODE::PARTIAL_MODE(PARTIAL_MODE const& other) = default;
PARTIAL_MODE::PARTIAL_MODE(PARTIAL_MODE&& other) noexcept = default;
PARTIAL_MODE& PARTIAL_MODE::operator=(PARTIAL_MODE const& other) = default;
PARTIAL_MODE& PARTIAL_MODE::operator=(PARTIAL_MODE&& other) noexcept = default;
PARTIAL_MODE::~PARTIAL_MODE() = default;

void PARTIAL_MODE::set(char const* const* keys)
{
    if (keys == nullptr)
        return clear();
    bool const isRemoval = *keys && **keys == '\0';
    if (isRemoval)
        ++keys;
    for (; *keys; ++keys)
        isRemoval ? erase(*keys) : insert(*keys);
}

void PARTIAL_MODE::clear()
{
    m_index.Drop();
    m_keys.clear();
    m_prefixes.clear();
}

void PARTIAL_MODE::insert(std::string key)
{
    if (key.empty())
        return;
    m_index.Drop();
    if (wildcard(key))
        m_prefixes.insert(key);
    else
        m_keys.insert(std::move(key));
}

void PARTIAL_MODE::erase(std::string key)
{
    m_index.Drop();
    if (wildcard(key))
        m_prefixes.erase(key);
    else
        m_keys.erase(key);
}

bool PARTIAL_MODE::wildcard(std::string& key)
{
    if (key.empty() || key.back() != '*')
        return false;
    key.pop_back();
    return true;
}

bool PARTIAL_MODE::multi_contains(std::string const& key) const { return Selects(key); }

bool PARTIAL_MODE::Selects(std::string_view key) const { return m_index.Selects(key, m_keys, m_prefixes); }

PARTIAL_COLLECT_ACTION::PARTIAL_COLLECT_ACTION(SETMULTIPAR_LIST* list, PARTIAL_MODE const& mode)
    : m_list(list), m_mode(&mode)
{
}

bool PARTIAL_COLLECT_ACTION::CollectAction(void* action, char const* key, PARAM_TYPE type, void const* value,
                                           int pos)
{
    if (comgui::detail::IsParameter(type))
        static_cast<PARTIAL_COLLECT_ACTION*>(action)->SetParameter(key, type, value, pos);
    return true;
}

int PARTIAL_COLLECT_ACTION::SetParameter(char const* key, PARAM_TYPE type, void const* value, int pos)
{
    if (m_mode->Selects(key))
        m_list->ySetParameter(key, type, value, pos);
    return 1;
}

FILTERED_PARTIAL_COLLECT_ACTION::FILTERED_PARTIAL_COLLECT_ACTION(SETMULTIPAR_LIST* list,
                                                                 PARTIAL_MODE const& mode)
    : m_list(list), m_mode(&mode)
{
}

bool FILTERED_PARTIAL_COLLECT_ACTION::CollectAction(void* action, char const* key, PARAM_TYPE type,
                                                    void const* value, int pos)
{
    if (comgui::detail::IsParameter(type))
        static_cast<FILTERED_PARTIAL_COLLECT_ACTION*>(action)->SetParameter(key, type, value, pos);
    return true;
}

int FILTERED_PARTIAL_COLLECT_ACTION::SetParameter(char const* key, PARAM_TYPE type, void const* value,
                                                  int pos)
{
    if (!m_mode->Selects(key))
        m_list->ySetParameter(key, type, value, pos);
    return 1;
}
