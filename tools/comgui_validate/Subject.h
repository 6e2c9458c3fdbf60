// A ticket as the checks of values, tables and walks see it: through the slots of a container, or through
// those of a table of its own. Each call is noted, so that a failure can show it.
#pragma once

#include "comgui/ticket/MTICKET_ACCESS.h"
#include "tools/comgui_validate/Trial.h"
#include "tools/comgui_validate/Value.h"
#include <functional>
#include <optional>
#include <set>
#include <string>

namespace validate
{
class Subject
{
public:
    explicit Subject(Trial& trial) : m_trial(trial) {}
    virtual ~Subject() = default;
    Subject(Subject const&) = delete;
    Subject& operator=(Subject const&) = delete;

    Trial& GetTrial() const { return m_trial; }

    // The slots' results. What may be written under a key is deleted at the end.
    int Write(std::string const& key, Value const& value, int position = -1);
    int Delete(std::string const& key, int position = -1);
    int WriteTable(SETMULTIPAR* table);
    int ReadTable(GETMULTIPAR* table);

    // None if the slot failed. Expects that it has then left the place of the value, and otherwise has
    // written to no more than that.
    std::optional<Value> Read(std::string const& key, PARAM_TYPE type, int position = -1);

    void ExpectWrite(char const* rule, std::string const& key, Value const& value, int position = -1);
    void ExpectValue(char const* rule, std::string const& key, Value const& value, int position = -1);
    void ExpectNothing(char const* rule, std::string const& key, PARAM_TYPE type, int position = -1);

    // The keys are the subject's to delete, also where others have written them.
    void Forget();
    void Keep() { m_keys.clear(); }  // what was written stays

    virtual STICKET_ACCESS const* Table() const { return nullptr; }  // its own, if it has one

protected:
    virtual int Get(char const* key, PARAM_TYPE type, void* value, int position) = 0;
    virtual int Set(char const* key, PARAM_TYPE type, void const* value, int position) = 0;
    virtual int GetAll(GETMULTIPAR* table) = 0;
    virtual int SetAll(SETMULTIPAR* table) = 0;
    virtual std::string Call(char const* slot) const = 0;  // "MGETPARAMETER(3, 1, "

private:
    void Calling(char const* slot, std::string const& key, PARAM_TYPE type, std::string const& value,
                 int position);

    Trial& m_trial;
    std::set<std::string> m_keys;
};

class InContainer : public Subject
{
public:
    InContainer(Trial& trial, MTICKET_ACCESS const* container, int type, int id)
        : Subject(trial), m_container(container), m_type(type), m_id(id)
    {
    }
    ~InContainer() override { Forget(); }

private:
    int Get(char const* key, PARAM_TYPE type, void* value, int position) override;
    int Set(char const* key, PARAM_TYPE type, void const* value, int position) override;
    int GetAll(GETMULTIPAR* table) override;
    int SetAll(SETMULTIPAR* table) override;
    std::string Call(char const* slot) const override;

    MTICKET_ACCESS const* const m_container;
    int const m_type;
    int const m_id;
};

class WithTable : public Subject
{
public:
    WithTable(Trial& trial, STICKET_ACCESS const* ticket) : Subject(trial), m_ticket(ticket) {}
    ~WithTable() override { Forget(); }

    STICKET_ACCESS const* Table() const override { return m_ticket; }

    // What the walk delivers, as a write takes it; the action may end it.
    using Action =
        std::function<bool(std::string const& key, PARAM_TYPE type, void const* word, int position)>;
    int Walk(Action const& action);

private:
    int Get(char const* key, PARAM_TYPE type, void* value, int position) override;
    int Set(char const* key, PARAM_TYPE type, void const* value, int position) override;
    int GetAll(GETMULTIPAR* table) override;
    int SetAll(SETMULTIPAR* table) override;
    std::string Call(char const* slot) const override;

    STICKET_ACCESS const* const m_ticket;
};

// The key of that name among those that checks use.
std::string Key(std::string const& name);

// A record of a table.
SETMULTIPAR ToWrite(std::string const& key, WrittenWord const& word, PARAM_TYPE type, int position);
GETMULTIPAR ToRead(std::string const& key, PARAM_TYPE type, ReadPlace& place, int position);
}  // namespace validate
