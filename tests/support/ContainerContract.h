// What the container of the bundle and the fake that stands in for it agree on, as one suite that both pass:
// instantiate ContainerContract with a way to make one, and build ContainerContract.cpp in. It goes further
// than a plug-in of another maker must, which may answer a refused call or an odd position in its own way.
#pragma once

#include "comgui/ticket/MTICKET_ACCESS.h"
#include <gtest/gtest.h>
#include <memory>
#include <string>

// A container with a ticket that its session may write to and delete, and that has none of the suite's short
// keys. missingId: an id of that type that is no ticket.
class CONTAINER_SUBJECT
{
public:
    virtual ~CONTAINER_SUBJECT() = default;
    virtual MTICKET_ACCESS const* Access() = 0;

    int type = 3;
    int id = 1;
    int missingId = 99;
};

struct CONTAINER_MAKER
{
    char const* name;
    std::unique_ptr<CONTAINER_SUBJECT> (*make)();
};

class ContainerContract : public testing::TestWithParam<CONTAINER_MAKER>
{
protected:
    ContainerContract() : subject(GetParam().make()), access(subject->Access()) {}

    // Through the slots, on the subject's ticket. What Read leaves in value is the slot's doing.
    int Read(char const* key, PARAM_TYPE type, void* value, int pos = -1) const;
    int Write(char const* key, PARAM_TYPE type, void const* value, int pos = -1) const;

    int WriteInt(char const* key, int value, int pos = -1) const
    {
        return Write(key, PARAM_INT, &value, pos);
    }
    int WriteText(char const* key, char const* text, int pos = -1) const
    {
        return Write(key, PARAM_STRING, text, pos);
    }
    int Delete(char const* key, int pos = -1) const { return Write(key, PARAM_NONE, nullptr, pos); }

    // -1, "" or 0 for what cannot be read.
    int Int(char const* key, int pos = -1) const;
    std::string Text(char const* key, int pos = -1) const;
    unsigned long Count(char const* key) const;
    int Type(char const* key, int pos) const;

    std::unique_ptr<CONTAINER_SUBJECT> subject;
    MTICKET_ACCESS const* access;
};
