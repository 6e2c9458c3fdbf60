// Streams past the borders of 32 bits.
#include "comgui/stream/MTICKET_BINSTREAM.h"
#include "comgui/stream/STICKET_BINSTREAM.h"
#include "tests/stream/AddressSpace.h"
#include "tests/stream/ContainerBytes.h"
#include <climits>
#include <gtest/gtest.h>
#include <utility>

namespace
{
constexpr auto OK = MTICKET_BINSTREAM::GET_TICKET_OK;
constexpr auto END = MTICKET_BINSTREAM::GET_TICKET_END;
constexpr auto ERROR = MTICKET_BINSTREAM::GET_TICKET_ERROR;

constexpr unsigned long GiB = 1ul << 30;

// One operation with that many bytes behind its header, of which it claims some as payload.
class LargeStream
{
public:
    LargeStream(unsigned long bytes, unsigned int payloadSize) : m_space(9 + 16 + bytes)
    {
        m_space.Put(0, Signature + Operation(106, "", static_cast<int>(payloadSize)));
    }

    bool Checked() const { return MTICKET_BINSTREAM::Check(m_space.Data(), m_space.Size()); }

    MTICKET_BINSTREAM::eGetTicketResult First() const { return Results().first; }
    MTICKET_BINSTREAM::eGetTicketResult Second() const { return Results().second; }

private:
    std::pair<MTICKET_BINSTREAM::eGetTicketResult, MTICKET_BINSTREAM::eGetTicketResult> Results() const
    {
        MTICKET_BINSTREAM::Read reader(m_space.Data(), m_space.Size(), false);
        int type;
        int id;
        TICKET_OP op = STICKET_OP_INVALID;
        auto const first = reader.ParseOperation(type, id, op);
        return {first, first == OK ? reader.ParseOperation(type, id, op) : ERROR};
    }

    AddressSpace m_space;
};
}  // namespace

TEST(LargeContainer, LargestPayload_IsTaken)
{
    LargeStream const stream(INT_MAX, INT_MAX);
    EXPECT_EQ(stream.First(), OK);
    EXPECT_EQ(stream.Second(), END);
    EXPECT_TRUE(stream.Checked());
}

TEST(LargeContainer, TwoGiBLeft_AreTooFewForAnyPayload_ByDesign)
{
    LargeStream const stream(2 * GiB, 0);
    EXPECT_EQ(stream.First(), ERROR);
    EXPECT_FALSE(stream.Checked());
}

TEST(LargeContainer, FourGiBLeft_DoNotCount_ByDesign)
{
    EXPECT_EQ(LargeStream(4 * GiB + 3, 3).First(), OK);
    EXPECT_EQ(LargeStream(4 * GiB + 3, 4).First(), ERROR);
    EXPECT_FALSE(LargeStream(4 * GiB + 3, 4).Checked());
}

// Both as numbers of 32 bits: the reader would take it and move back by 2 GiB.
TEST(LargeContainer, PayloadOfTwoGiBWithinTheBuffer_IsNotGood)
{
    EXPECT_FALSE(LargeStream(3 * GiB, 1u << 31).Checked());
}

// Of binary values of 128 MiB less one byte: their bytes are passed over and never touched.
TEST(LargeTicket, StreamPastFourGiB_IsCheckedToItsEnd)
{
    constexpr unsigned long value = 4 + (1ul << 27) - 1;
    constexpr unsigned long values = 33;
    AddressSpace space(10 + values * value + 2);
    space.Put(0, "\x09STICKET_1");
    for (unsigned long i = 0; i < values; ++i)
        space.Put(10 + i * value, "\x9F\xFF\xFF\xFF");
    space.Put(space.Size() - 2, "\x41\x07");
    EXPECT_TRUE(STICKET_BINSTREAM::Check(space.Data(), space.Size()));
    EXPECT_FALSE(STICKET_BINSTREAM::Check(space.Data(), space.Size() - 1));
    EXPECT_TRUE(STICKET_BINSTREAM::Check(space.Data(), space.Size() - 2));
    EXPECT_FALSE(STICKET_BINSTREAM::Check(space.Data(), space.Size() - 3));
    space.Put(space.Size() - 2, "\xE5");
    EXPECT_FALSE(STICKET_BINSTREAM::Check(space.Data(), space.Size()));
}
