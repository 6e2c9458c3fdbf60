// A ticket that a test changes step by step, with what a plain map makes of the same changes.
#pragma once

#include "standin/server/tickets/TicketSnapshot.h"
#include <algorithm>
#include <gtest/gtest.h>
#include <map>
#include <string>
#include <vector>

struct MODEL_VALUE
{
    PARAM_TYPE type;
    unsigned long long word;
    std::string bytes;

    explicit MODEL_VALUE(standin::TicketValue const& value)
        : type(value.type), word(value.word), bytes(value.text ? value.text->bytes : std::string())
    {
    }
    explicit MODEL_VALUE(standin::TicketElement const& element)
        : type(element.type), word(element.IsText() ? 0 : element.word),
          bytes(element.IsText() ? element.text->bytes : std::string())
    {
    }
    friend bool operator==(MODEL_VALUE const&, MODEL_VALUE const&) = default;
};
using TICKET_MODEL = std::map<std::string, std::map<int, MODEL_VALUE>>;

inline standin::ParameterChange Putting(std::string const& key, int pos, standin::TicketValue value)
{
    return {key, pos, std::move(value)};
}
inline standin::ParameterChange Dropping(std::string const& key, int pos = -1) { return {key, pos, {}}; }

class EditedTicket
{
public:
    EditedTicket() = default;
    ~EditedTicket() { standin::SnapshotEdit::Destroy(m_now); }
    EditedTicket(EditedTicket const&) = delete;
    EditedTicket& operator=(EditedTicket const&) = delete;

    standin::TicketSnapshot const* Now() const { return m_now; }
    TICKET_MODEL const& Model() const { return m_model; }
    standin::KeyPool& Keys() { return m_keys; }

    // Makes the changes in one edit. Gives what the new snapshot does not share with the one before.
    standin::Garbage Make(std::vector<standin::ParameterChange> changes)
    {
        standin::SnapshotEdit edit(m_now);
        for (standin::ParameterChange const& change : changes)
            edit.Make(m_keys.Intern(change.key), change);
        standin::Garbage garbage;
        m_now = edit.Finish({1, ++m_revision}, garbage);
        for (standin::ParameterChange& change : changes)
        {
            Remember(change);
            static_cast<void>(change.value.text.release());  // the snapshot's from now on
        }
        return garbage;
    }
    template <typename... Changes>
    standin::Garbage Make(standin::ParameterChange first, Changes... more)
    {
        std::vector<standin::ParameterChange> changes;
        changes.push_back(std::move(first));
        (changes.push_back(std::move(more)), ...);
        return Make(std::move(changes));
    }

    // Takes over what a test has made of Now() by an edit of its own.
    void Become(standin::TicketSnapshot const* next) { m_now = next; }

    // Whatever can be asked of a snapshot, against a model.
    static void ExpectEqual(standin::TicketSnapshot const& ticket, TICKET_MODEL const& model)
    {
        ASSERT_EQ(ticket.Keys(), model.size());
        auto const sorted = ticket.Sorted();
        ASSERT_EQ(sorted.size(), model.size());
        auto place = sorted.begin();
        for (auto const& [key, values] : model)
        {
            standin::KeyValues const& found = **place++;
            ASSERT_EQ(found.Name()->Text(), key);
            ASSERT_EQ(ticket.Find(key), &found);
            ASSERT_EQ(ticket.Find(found.Name()), &found);
            ASSERT_EQ(ticket.Find(key + "?"), nullptr);
            ExpectEqual(found, values);
        }
        std::size_t visited = 0;
        ticket.ForEachKey([&](standin::KeyValues const& values)
                          { visited += model.contains(values.Name()->CStr()) ? 1 : 0; });
        ASSERT_EQ(visited, model.size());
    }

    static void ExpectEqual(standin::KeyValues const& found, std::map<int, MODEL_VALUE> const& values)
    {
        ASSERT_EQ(found.Elements().size(), values.size()) << found.Name()->Text();
        int const count = values.rbegin()->first + 1;
        ASSERT_EQ(found.Count(), count);
        for (auto const& [pos, value] : values)
        {
            ASSERT_TRUE(found.At(pos)) << found.Name()->Text() << ' ' << pos;
            ASSERT_EQ(MODEL_VALUE(*found.At(pos)), value);
            ASSERT_EQ(found.From(pos), found.At(pos));
            ASSERT_EQ(found.At(pos + 1) != nullptr, values.contains(pos + 1));
        }
        ASSERT_EQ(found.At(count), nullptr);
        ASSERT_EQ(found.From(0)->pos, values.begin()->first);
        ASSERT_EQ(found.From(count), nullptr);
    }

private:
    void Remember(standin::ParameterChange const& change)
    {
        auto& values = m_model[change.key];
        if (change.pos == -1)
            values.clear();
        int const pos = std::max(change.pos, 0);
        values.erase(pos);
        if (change.value.type != PARAM_NONE)
            values.emplace(pos, MODEL_VALUE(change.value));
        if (values.empty())
            m_model.erase(change.key);
    }

    standin::KeyPool m_keys;
    standin::TicketSnapshot const* m_now = nullptr;
    TICKET_MODEL m_model;
    std::uint64_t m_revision = 0;
};
