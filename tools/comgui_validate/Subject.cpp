#include "tools/comgui_validate/Subject.h"

#include <exception>

namespace validate
{
void Subject::Calling(char const* slot, std::string const& key, PARAM_TYPE type, std::string const& value,
                      int position)
{
    m_trial.Calling(Call(slot) + Quoted(key) + ", " + NameOf(type) + ", " + value + ", " +
                    std::to_string(position) + ")");
}

int Subject::Write(std::string const& key, Value const& value, int position)
{
    m_keys.insert(key);
    WrittenWord const word(value);
    Calling("SETPARAMETER", key, value.type, Shown(value), position);
    return Set(key.c_str(), value.type, word.Get(), position);
}

int Subject::Delete(std::string const& key, int position)
{
    Calling("SETPARAMETER", key, PARAM_NONE, "null", position);
    return Set(key.c_str(), PARAM_NONE, nullptr, position);
}

int Subject::WriteTable(SETMULTIPAR* table)
{
    for (SETMULTIPAR const* record = table; record->key; ++record)
        m_keys.insert(record->key);
    m_trial.Calling(Call("SETMULTIPAR") + "table)");
    return SetAll(table);
}

int Subject::ReadTable(GETMULTIPAR* table)
{
    m_trial.Calling(Call("GETMULTIPAR") + "table)");
    return GetAll(table);
}

std::optional<Value> Subject::Read(std::string const& key, PARAM_TYPE type, int position)
{
    ReadPlace place;
    Calling("GETPARAMETER", key, type, "&value", position);
    if (Get(key.c_str(), type, place.Get(), position) == 0)
    {
        m_trial.Expect("V1", place.IsUntouched(), "0, and the place of the value has changed",
                       "an untouched place");
        return std::nullopt;
    }
    m_trial.Expect("V2", place.IsUntouchedBehind(type), "a change behind the place of the value",
                   "no more than the width of the type");
    auto value = place.As(type);
    m_trial.Expect("V2", value.has_value(), "success, and null", "a value");
    return value;
}

void Subject::ExpectWrite(char const* rule, std::string const& key, Value const& value, int position)
{
    m_trial.ExpectSuccess(rule, Write(key, value, position));
}

void Subject::ExpectValue(char const* rule, std::string const& key, Value const& value, int position)
{
    auto const read = Read(key, value.type, position);
    m_trial.Expect(rule, read == value, Shown(read), Shown(value));
}

void Subject::ExpectNothing(char const* rule, std::string const& key, PARAM_TYPE type, int position)
{
    auto const read = Read(key, type, position);
    m_trial.Expect(rule, !read, Shown(read), "0, for there is no such value");
}

void Subject::Forget()
{
    for (std::string const& key : m_keys)
        Set(key.c_str(), PARAM_NONE, nullptr, -1);
    m_keys.clear();
}

int InContainer::Get(char const* key, PARAM_TYPE type, void* value, int position)
{
    return m_container->MGETPARAMETER(m_container->Instance, m_type, m_id, key, type, value, position);
}
int InContainer::Set(char const* key, PARAM_TYPE type, void const* value, int position)
{
    return m_container->MSETPARAMETER(m_container->Instance, m_type, m_id, key, type, value, position);
}
int InContainer::GetAll(GETMULTIPAR* table)
{
    return m_container->MGETMULTIPAR(m_container->Instance, m_type, m_id, table);
}
int InContainer::SetAll(SETMULTIPAR* table)
{
    return m_container->MSETMULTIPAR(m_container->Instance, m_type, m_id, table);
}
std::string InContainer::Call(char const* slot) const
{
    return std::string("M") + slot + "(" + std::to_string(m_type) + ", " + std::to_string(m_id) + ", ";
}

int WithTable::Get(char const* key, PARAM_TYPE type, void* value, int position)
{
    return m_ticket->SGETPARAMETER(m_ticket->Instance, key, type, value, position);
}
int WithTable::Set(char const* key, PARAM_TYPE type, void const* value, int position)
{
    return m_ticket->SSETPARAMETER(m_ticket->Instance, key, type, value, position);
}
int WithTable::GetAll(GETMULTIPAR* table) { return m_ticket->SGETMULTIPAR(m_ticket->Instance, table); }
int WithTable::SetAll(SETMULTIPAR* table) { return m_ticket->SSETMULTIPAR(m_ticket->Instance, table); }
std::string WithTable::Call(char const* slot) const { return std::string("S") + slot + "("; }

int WithTable::Walk(Action const& action)
{
    struct Context
    {
        Action const& action;
        std::exception_ptr failure{};  // it must not pass through the plug-in
    } context{action};
    GetTrial().Calling("SWALKPARAMETERS(action, context, \"\", 8000)");
    int const result = comgui::detail::Walk(
        m_ticket,
        [](void* place, char const* key, PARAM_TYPE type, void const* word, int position)
        {
            auto& here = *static_cast<Context*>(place);
            try
            {
                return here.action(key ? key : "", type, word, position);
            }
            catch (...)
            {
                here.failure = std::current_exception();
                return false;
            }
        },
        &context);
    if (context.failure)
        std::rethrow_exception(context.failure);
    return result;
}

std::string Key(std::string const& name) { return "ComGUIValidate/" + name; }

SETMULTIPAR ToWrite(std::string const& key, WrittenWord const& word, PARAM_TYPE type, int position)
{
    return {key.c_str(), type, 0, word.Get(), position, false, {}};
}

GETMULTIPAR ToRead(std::string const& key, PARAM_TYPE type, ReadPlace& place, int position)
{
    return {key.c_str(), type, 0, place.Get(), position, false, {}};
}
}  // namespace validate
