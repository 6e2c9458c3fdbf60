#include "comgui/host/NotifData.h"

NotifData::NotifData(void* user, int kind, int argA, int argB, int code, int valueType, char const* key)
    : pUser(user), NotifKind(kind), NotifArgA(argA), NotifArgB(argB), NotifCode(code),
      NotifValueType(valueType), NotifKey(key ? wxString::FromUTF8(key) : wxString()), NotifNumber(0),
      NotifPos(-1)
{
}

NotifData::NotifData(NotifData const& other) = default;
