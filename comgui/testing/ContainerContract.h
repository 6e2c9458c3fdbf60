// The behaviour that the container of the bundle and its fake share, as one test suite: which ticket a slot
// addresses, and its deletion. TicketContract covers the values of a ticket. To use the suite, instantiate
// ContainerContract with a CONTAINER_MAKER and build ContainerContract.cpp into the test program. It is
// stricter than MTICKET_ACCESS.h: another plug-in may treat refused calls differently.
#pragma once

#include "comgui/ticket/MTICKET_ACCESS.h"
#include <gtest/gtest.h>
#include <memory>

namespace comgui::test
{
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

    // Through the slots, on a ticket of the subject's type. Int: -1 for what cannot be read.
    int Int(int id, char const* key) const;
    int SetInt(int id, char const* key, int value) const;

    std::unique_ptr<CONTAINER_SUBJECT> subject;
    MTICKET_ACCESS const* access;
};
}  // namespace comgui::test
