// One way in which records can be sent and kept: the library's, or one of those that a team would pick in its
// place. All start from the same table and end with what their users look at, so that the costs compare.
#pragma once

#include "bench/workloads.h"

#include <cstddef>
#include <memory>
#include <string_view>

class PEER
{
public:
    virtual ~PEER() = default;

    // The records as bytes. They belong to the peer and die at its next Write.
    virtual std::string_view Write(SETMULTIPAR* table) = 0;

    // Reads bytes into what a client would look at, and destroys that. Gives the number of entries found,
    // which is more than 0.
    virtual std::size_t Read(std::string_view bytes) = 0;

    // The same, to be kept: what a client would look at lives as long as the result, and so must bytes if the
    // format refers to them. Null if nothing was found.
    virtual std::shared_ptr<void> Keep(std::string_view bytes) = 0;

    // Whether what is read refers to the bytes that it was read from.
    virtual bool KeepsBytes() const { return false; }

    // Reads bytes and tells each value to comparison.
    virtual void Tell(std::string_view bytes, COMPARISON& comparison) = 0;
};

// A peer that keeps its records in a message of its own, besides its bytes.
class BUILDER
{
public:
    virtual ~BUILDER() = default;

    // Builds a message from the records and destroys it. Gives the number of entries.
    virtual std::size_t Build(SETMULTIPAR const* table) = 0;

    // Builds one and tells each of its values to comparison.
    virtual void TellBuilt(SETMULTIPAR const* table, COMPARISON& comparison) = 0;
};

std::unique_ptr<PEER> MakeComgui();
std::unique_ptr<PEER> MakeProtobuf();      // a vector is one packed field
std::unique_ptr<PEER> MakeProtobufEach();  // each value of a vector is a message
std::unique_ptr<PEER> MakeProtobufHeap();
std::unique_ptr<PEER> MakeProtobufEachHeap();
std::unique_ptr<PEER> MakeMsgpack();        // writes a std::string, as the library does
std::unique_ptr<PEER> MakeMsgpackBuffer();  // writes msgpack's own buffer
std::unique_ptr<PEER> MakeIpp();

std::unique_ptr<BUILDER> MakeComguiBuilder();
std::unique_ptr<BUILDER> MakeProtobufBuilder();
std::unique_ptr<BUILDER> MakeProtobufHeapBuilder();
