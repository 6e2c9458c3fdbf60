#include "TicketForm.h"

#include "Shown.h"
#include <algorithm>
#include <set>

namespace
{
Json ToJson(int value) { return value; }
Json ToJson(double value) { return value; }
Json ToJson(wxString const& value) { return value.utf8_string(); }

Json ToJson(wxVariant const& value)
{
    if (value.GetType() == "long")
        return value.GetLong();
    if (value.GetType() == "double")
        return value.GetDouble();
    return ToJson(value.GetString());
}

bool AddKey(void* keys, char const* key, PARAM_TYPE, void const*, int)
{
    auto& known = *static_cast<std::vector<std::string>*>(keys);
    if (std::find(known.rbegin(), known.rend(), key) == known.rend())
        known.emplace_back(key);
    return true;
}
}  // namespace

std::string Line(Json const& value)
{
    return Shown(value.dump(-1, ' ', false, Json::error_handler_t::replace));
}

TicketForm::TicketForm(ComGUIManager& manager, MTICKET_ACCESS const* container, int type, int id)
    : m_manager(manager), m_container(container), m_type(type), m_id(id),
      m_ticket(MTICKET_READ::Of(container)->OpenTicket(type, id))
{
    if (!m_ticket)
        throw Refusal("there is no " + Name() + "; ticket_form list " + std::to_string(type) +
                      " tells which there are");
}

TicketForm::~TicketForm() { m_manager.CloseTicket(m_container, m_type, m_id); }

std::string TicketForm::Name() const
{
    return "ticket " + std::to_string(m_type) + "/" + std::to_string(m_id);
}

std::vector<std::string> TicketForm::Keys() const
{
    constexpr int Everything = 8000;
    std::vector<std::string> keys;
    m_ticket->SWALKPARAMETERS(m_ticket->Instance, AddKey, &keys, "", Everything);
    return keys;
}

bool TicketForm::Has(std::string const& key, FIELD& field) const
{
    int type = PARAM_NONE;
    int elementType = PARAM_NONE;
    bool const has = m_manager.GetKeyParameterType(m_container, m_type, m_id, key.c_str(), type, elementType);
    if (type == PARAM_COUNT)  // a list may begin with a gap
        for (int pos = 1, count = Count(key); elementType == PARAM_NONE && pos < count; ++pos)
            elementType = TypeAt(key, pos);
    field = {key, static_cast<PARAM_TYPE>(type), static_cast<PARAM_TYPE>(elementType)};
    return has;
}

FIELD TicketForm::Field(std::string const& key) const
{
    FIELD field;
    if (!Has(key, field))
        throw Refusal(Name() + " has no " + key + "; ticket_form keys " + std::to_string(m_type) + " " +
                      std::to_string(m_id) + " tells what it has");
    return field;
}

PARAM_TYPE TicketForm::TypeAt(std::string const& key, int pos) const
{
    return static_cast<PARAM_TYPE>(
        MTICKET_READ::Of(m_container)->ParameterType(m_type, m_id, key.c_str(), pos));
}

int TicketForm::Count(std::string const& key) const
{
    return m_manager.GetValueCount(m_container, m_type, m_id, wxString::FromUTF8(key.c_str()));
}

template <typename T>
Json TicketForm::Number(std::string const& key, PARAM_TYPE type, int pos) const
{
    T value = 0;
    return m_manager.GetParameter(m_container, m_type, m_id, key.c_str(), type, &value, pos) > 0 ? Json(value)
                                                                                                 : Json();
}

Json TicketForm::Element(std::string const& key, int pos) const
{
    switch (PARAM_TYPE const type = TypeAt(key, pos))
    {
    case PARAM_INT:
    case PARAM_DOUBLE:
    case PARAM_STRING:
    {
        wxVariant value;  // without a marker: what goes meanwhile is missing, and no -1
        bool const isRead =
            m_manager.GetParameterEx(m_container, m_type, m_id, key.c_str(), value, pos, wxNullVariant) > 0;
        return isRead ? ToJson(value) : Json();
    }
    case PARAM_INT64:  // no variant holds the others
        return Number<long long>(key, PARAM_INT64, pos);
    case PARAM_UNSIGNED:
        return Number<unsigned int>(key, PARAM_UNSIGNED, pos);
    case PARAM_UNSIGNED64:
        return Number<unsigned long long>(key, PARAM_UNSIGNED64, pos);
    case PARAM_NONE:
        return {};
    default:
        return std::string("(") + NameOf(type) + ")";
    }
}

// Null for a list that is not of that type throughout.
template <typename T>
Json TicketForm::Elements(FIELD const& field) const
{
    std::vector<T> values;
    if (!m_manager.GetVectorParameter(m_type, m_id, field.key.c_str(), values))
        return {};
    Json all = Json::array();
    for (T const& value : values)
        all.push_back(ToJson(value));
    return all;
}

Json TicketForm::Value(FIELD const& field) const
{
    if (field.type != PARAM_COUNT)
        return Element(field.key, -1);
    Json all;
    if (field.elementType == PARAM_INT)
        all = Elements<int>(field);
    else if (field.elementType == PARAM_DOUBLE)
        all = Elements<double>(field);
    else if (field.elementType == PARAM_STRING)
        all = Elements<wxString>(field);
    int const count = Count(field.key);
    if (all.is_array() && all.size() == static_cast<std::size_t>(count))
        return all;
    all = Json::array();  // several types, or gaps
    for (int pos = 0; pos < count; ++pos)
        all.push_back(Element(field.key, pos));
    return all;
}

Json TicketForm::Value(FIELD const& field, int pos) const
{
    if (TypeAt(field.key, pos) == PARAM_NONE)
        throw Refusal(Name() + " has nothing at position " + std::to_string(pos) + " of " + field.key);
    return Element(field.key, pos);
}

void TicketForm::Write(SETMULTIPAR_LIST& list) const
{
    m_manager.SetMultiParameter(m_container, m_type, m_id, list);
    std::string refused;
    std::set<std::string> told;
    for (SETMULTIPAR const* record = list.Table(false); record && record->key; ++record)
        if (!record->ok && told.insert(record->key).second)
            refused += (refused.empty() ? "" : ", ") + std::string(record->key);
    if (!refused.empty())
        throw Refusal("the server does not take " + refused + " in " + Name() + "; may this user write it?");
}

void TicketForm::Delete(FIELD const& field, int pos) const
{
    if (pos != -1)
        Value(field, pos);
    if (m_manager.DeleteParameter(m_container, m_type, m_id, field.key.c_str(), pos) == 0)
        throw Refusal("the server does not delete " + field.key + " of " + Name() +
                      "; may this user write it?");
}
