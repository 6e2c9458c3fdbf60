// What one transaction does to one ticket: how a writer plans it, how the store keeps it in its journal, and
// how every program of the site hears of it. A change says what is different afterwards and nothing else: a
// deletion of what is not there is no part of it, and an appended value has the position that it got.
#pragma once

#include "standin/server/tickets/ParameterChange.h"
#include "standin/server/tickets/TicketAddress.h"
#include <cstdint>
#include <vector>

namespace standin
{
// Numbers the changes of a site from 1 up, without gaps, in the order of their commits.
using Sequence = std::uint64_t;

// Distinguishes a ticket from others that had or will have its address: the number of the change that made
// it. 0: no ticket at all.
using Incarnation = Sequence;

// Numbers the programs that have had the site open, from 1 up; none is given twice. 0: none.
using ProgramId = std::int64_t;

struct TicketChange
{
    enum Kind : int  // the numbers are kept in journals
    {
        Write = 1,
        Create = 4,
        Delete = 5,
    };
    enum class Owner
    {
        Unchanged,    // of a creation: nobody
        ThisProgram,  // the ticket goes when the program that commits this dies
        Nobody,
    };
    static constexpr int NextId = -1;  // in the place of an id
    static constexpr Sequence AnyRevision = 0;

    Kind kind = Write;

    // Of a creation with NextId: the store gives the id above the largest of the type that is in use, and
    // above aboveId; 1 for the first of a type. With the largest possible in use, the smallest free one.
    TicketAddress address{};
    int aboveId = 0;

    // The ticket on which the change was planned: its incarnation, and the number of the last change that it
    // had seen. Of a creation both are ignored, and filled in when it is read from the journal.
    Incarnation incarnation = 0;
    Sequence revision = AnyRevision;

    // Other tickets that it was planned on, and that must be as they were then. Not kept in the journal.
    struct Basis
    {
        TicketAddress address;
        Incarnation incarnation;
        Sequence revision;
    };
    std::vector<Basis> others;

    std::vector<ParameterChange> parameters;  // in order; of a creation what the ticket begins with
    Owner owner = Owner::Unchanged;           // not kept in the journal
};

// A change that was committed, by whichever program.
struct CommittedChange
{
    Sequence sequence = 0;
    ProgramId program = 0;     // who made it
    std::uint64_t number = 0;  // the program's own number of it
    TicketChange change;
};
}  // namespace standin
