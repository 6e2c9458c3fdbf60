#include "standin/module/FolderReading.h"

namespace standin
{
FolderReading& FolderReading::OfThisThread()
{
    static thread_local FolderReading reading;
    return reading;
}

bool FolderReading::Note(void const* ticket, std::string_view key, PARAM_TYPE type, int number,
                         char const* text)
{
    if (key == UseFolderVariablesKey)
    {
        m_ticket = type == PARAM_INT && (number & 3) != 0 ? ticket : nullptr;
        m_decodes = (number & 1) != 0;
        m_next = 0;
        m_table = {};
        return false;
    }
    bool const isDue = ticket == m_ticket && m_next < FolderRows.size() && key == FolderRows[m_next].key &&
                       type == PARAM_STRING;
    if (!isDue)
    {
        Forget();
        return false;
    }
    ++m_next;
    return text && *text && !CanResolve(text);
}

bool FolderReading::CanResolve(std::string_view folder)
{
    FolderTable nothing;
    return (m_decodes ? m_table : nothing).Add(m_next - 1, folder);
}

std::string FolderReading::Resolved(FolderSettings const& folders)
{
    std::size_t const row = m_next - 1;
    std::string resolved = FolderTable(folders.values).FolderOf(FolderRows[row].variable).value_or("");
    if (m_decodes && !resolved.empty())
        m_table.Add(row, resolved);
    return resolved;
}
}  // namespace standin
