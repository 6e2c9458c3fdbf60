#include "comgui/module/ContainerSlots.h"

#include "comgui/module/Handles.h"
#include "comgui/module/Running.h"

namespace comgui::plugin
{
namespace
{
constinit Handles<ContainerSlots, 2> containers;

template <typename Work>
int ReadSlot(void* instance, Work const& work) noexcept
{
    ContainerSlots* const container = containers.Find(instance);
    return container ? RunRead(*container, [&] { return work(*container); }) : 0;
}

template <typename Work>
int Slot(void* instance, Work const& work) noexcept
{
    ContainerSlots* const container = containers.Find(instance);
    if (container)
        return RunSlot(*container, [&] { return work(*container); });
    RunStray(Failed);
    return 0;
}

int OnGet(void* instance, int type, int id, char const* key, PARAM_TYPE valueType, void* value, int pos)
{
    return ReadSlot(instance,
                    [&](ContainerSlots& container) {
                        return container.Get({type, id}, key, valueType, value, pos);
                    });
}

int OnGetTable(void* instance, int type, int id, GETMULTIPAR* table)
{
    ClearOk(table);
    return ReadSlot(instance,
                    [&](ContainerSlots& container) {
                        return container.GetTable({type, id}, table);
                    });
}

int OnWalk(void* instance, MWALKTICKETS_ACTION action, void* context, int type)
{
    return Slot(instance,
                [&](ContainerSlots& container) { return container.WalkTickets(action, context, type); });
}

int OnSet(void* instance, int type, int id, char const* key, PARAM_TYPE valueType, void const* value, int pos)
{
    return Slot(instance,
                [&](ContainerSlots& container) {
                    return container.Set({type, id}, key, valueType, value, pos);
                });
}

int OnSetTable(void* instance, int type, int id, SETMULTIPAR* table)
{
    ClearOk(table);
    return Slot(instance, [&](ContainerSlots& container) { return container.SetTable({type, id}, table); });
}

int OnOperation(void* instance, int type, int id, TICKET_OP op, void* arg)
{
    return Slot(instance,
                [&](ContainerSlots& container) {
                    return container.Operation({type, id}, op, arg);
                });
}

int OnSwitch(void* instance, int type, int id, int notification, bool enable, char const* const* keys)
{
    return Slot(instance,
                [&](ContainerSlots& container) {
                    return container.Switch({type, id}, notification, enable, keys);
                });
}

STICKET_ACCESS const* OnCreate(void* instance, int type, int id, char const* const* keys)
{
    STICKET_ACCESS const* made = nullptr;
    Slot(instance,
         [&](ContainerSlots& container)
         {
             made = container.CreateTicket({type, id}, keys);
             return made != nullptr;
         });
    return made;
}
}  // namespace

ContainerSlots::ContainerSlots()
{
    m_access.Instance = containers.Add(*this);
    m_access.MGETPARAMETER = OnGet;
    m_access.MGETMULTIPAR = OnGetTable;
    m_access.MWALKTICKETS = OnWalk;
    m_access.MSETPARAMETER = OnSet;
    m_access.MSETMULTIPAR = OnSetTable;
    m_access.MOPERATION = OnOperation;
    m_access.MENDISNOTIF = OnSwitch;
    m_access.MCREATETICKET = OnCreate;
}

ContainerSlots::~ContainerSlots() { containers.Remove(m_access.Instance); }

void ContainerSlots::Withdraw() noexcept { containers.Remove(m_access.Instance); }
}  // namespace comgui::plugin
