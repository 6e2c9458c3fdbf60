#include "desk/model/EditHistory.h"

#include <algorithm>
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

std::size_t SizeOf(EditHistory::Step const& step)
{
    std::size_t size = 0;
    for (Edit const& edit : step)
        size += SizeOf(edit);
    return size;
}
}  // namespace

void EditHistory::Record(comgui::TicketAddress ticket, std::string key, comgui::Value before,
                         comgui::Value after)
{
    if (before == after)
        return;
    for (Step const& step : m_redo)
        m_bytes -= SizeOf(step);
    m_redo.clear();
    if (m_taken)
        m_taken->isRedoVoid = true;
    Edit edit{ticket, std::move(key), std::move(before), std::move(after)};
    m_bytes += SizeOf(edit);
    if (m_groups > 0)
        AddToGroup(std::move(edit));
    else
        m_undo.push_back({std::move(edit)});
    Trim();
}

// A key that is edited twice in a group goes back to what it was before the first of them.
void EditHistory::AddToGroup(Edit edit)
{
    if (!std::exchange(m_isGroupBegun, true))
        m_undo.emplace_back();
    Step& step = m_undo.back();
    auto const [place, isNew] = m_placesInGroup.try_emplace({edit.ticket, edit.key}, step.size());
    if (isNew)
    {
        step.push_back(std::move(edit));
        return;
    }
    Edit& first = step[place->second];
    m_bytes -= SizeOf(edit) + SizeOf(first);
    first.after = std::move(edit.after);
    m_bytes += SizeOf(first);
}

void EditHistory::EndGroup()
{
    m_groups = std::max(0, m_groups - 1);
    if (m_groups > 0)
        return;
    m_isGroupBegun = false;
    m_placesInGroup.clear();
}

std::vector<EditWrite> EditHistory::Take(DIRECTION direction, Present const& present)
{
    bool const isBack = direction == DIRECTION::Back;
    auto& steps = isBack ? m_undo : m_redo;
    if (m_taken || m_groups > 0 || steps.empty())
        return {};
    std::vector<EditWrite> writes;
    for (Edit const& edit : steps.back())
    {
        EditWrite write{edit.ticket, edit.key, isBack ? edit.before : edit.after,
                        present(edit.ticket, edit.key), false};
        write.isForeign =
            write.present != (isBack ? edit.after : edit.before) && write.present != write.value;
        writes.push_back(std::move(write));
    }
    m_taken = TAKEN{direction, std::move(steps.back()), 0, false};
    steps.pop_back();
    m_taken->place = m_undo.size();
    return writes;
}

void EditHistory::Settle(std::vector<bool> const& written)
{
    if (!m_taken)
        return;
    Step done;
    Step left;
    for (std::size_t i = 0; i < m_taken->step.size(); ++i)
        (i < written.size() && written[i] ? done : left).push_back(std::move(m_taken->step[i]));
    bool const isBack = m_taken->direction == DIRECTION::Back;
    Step& toUndo = isBack ? left : done;
    Step& toRedo = isBack ? done : left;
    PutBack(DIRECTION::Back, std::move(toUndo));
    PutBack(DIRECTION::Forth, std::move(toRedo));
    m_taken.reset();
    Trim();
}

void EditHistory::Confirm()
{
    if (m_taken)
        Settle(std::vector<bool>(m_taken->step.size(), true));
}

// As a step to be taken in that direction.
void EditHistory::PutBack(DIRECTION direction, Step step)
{
    if (step.empty())
        return;
    if (direction == DIRECTION::Back)
        m_undo.insert(m_undo.begin() + static_cast<std::ptrdiff_t>(m_taken->place), std::move(step));
    else if (m_taken->isRedoVoid)
        m_bytes -= SizeOf(step);
    else
        m_redo.push_back(std::move(step));
}

void EditHistory::Clear() { *this = EditHistory(m_limits); }

// The oldest steps go first; what can be redone is younger than they are.
void EditHistory::Trim()
{
    while (m_undo.size() > 1 && (m_undo.size() > m_limits.steps || m_bytes > m_limits.bytes))
    {
        m_bytes -= SizeOf(m_undo.front());
        m_undo.pop_front();
        if (m_taken && m_taken->place > 0)
            --m_taken->place;
    }
}
}  // namespace desk
