#include "desk/model/EditHistory.h"

#include <utility>

namespace desk
{
namespace
{
std::size_t SizeOf(comgui::Value const& value)
{
    if (auto const* const text = std::get_if<std::string>(&value))
        return sizeof value + text->size();
    if (auto const* const binary = std::get_if<comgui::Bytes>(&value))
        return sizeof value + binary->bytes.size();
    std::size_t size = sizeof value;
    if (auto const* const list = std::get_if<comgui::List>(&value))
        for (comgui::Element const& element : *list)
            size += SizeOf(element.value);
    return size;
}

std::size_t SizeOf(Edit const& edit) { return edit.key.size() + SizeOf(edit.before) + SizeOf(edit.after); }
}  // namespace

void EditHistory::Record(comgui::TicketAddress ticket, std::string key, comgui::Value before,
                         comgui::Value after)
{
    if (before == after)
        return;
    for (Edit const& edit : m_redo)
        m_bytes -= SizeOf(edit);
    m_redo.clear();
    if (m_taken)
        m_taken->isRedoVoid = true;
    m_undo.push_back({ticket, std::move(key), std::move(before), std::move(after)});
    m_bytes += SizeOf(m_undo.back());
    Trim();
}

std::optional<EditWrite> EditHistory::Take(DIRECTION direction, Present const& present)
{
    bool const isBack = direction == DIRECTION::Back;
    auto& edits = isBack ? m_undo : m_redo;
    if (m_taken || edits.empty())
        return std::nullopt;
    Edit const& edit = edits.back();
    EditWrite write{edit.ticket, edit.key, isBack ? edit.before : edit.after, present(edit.ticket, edit.key),
                    false};
    write.isForeign = write.present != (isBack ? edit.after : edit.before) && write.present != write.value;
    m_taken = TAKEN{direction, std::move(edits.back()), 0, false};
    edits.pop_back();
    m_taken->place = m_undo.size();
    return write;
}

void EditHistory::Settle(bool isWritten)
{
    if (!m_taken)
        return;
    bool const isToUndo = (m_taken->direction == DIRECTION::Back) != isWritten;
    if (isToUndo)
        m_undo.insert(m_undo.begin() + static_cast<std::ptrdiff_t>(m_taken->place), std::move(m_taken->edit));
    else if (m_taken->isRedoVoid)
        m_bytes -= SizeOf(m_taken->edit);
    else
        m_redo.push_back(std::move(m_taken->edit));
    m_taken.reset();
    Trim();
}

void EditHistory::Clear() { *this = EditHistory(m_limits); }

// The oldest edits go first; what can be redone is younger than they are.
void EditHistory::Trim()
{
    while (m_undo.size() > 1 && (m_undo.size() > m_limits.edits || m_bytes > m_limits.bytes))
    {
        m_bytes -= SizeOf(m_undo.front());
        m_undo.pop_front();
        if (m_taken && m_taken->place > 0)
            --m_taken->place;
    }
}
}  // namespace desk
