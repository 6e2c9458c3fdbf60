#include "tests/tools/Streams.h"
#include "tools/ticketstream/ItemWalk.h"
#include "tools/ticketstream/OperationWalk.h"
#include "tools/ticketstream/Trouble.h"
#include "tools/ticketstream/detect.h"
#include "tools/ticketstream/whole.h"
#include <gtest/gtest.h>

using namespace ticketstream;

namespace
{
// The place of the break, or none.
std::optional<unsigned long> Break(std::string const& stream)
try
{
    MustBeWhole(stream);
    return {};
}
catch (BrokenStream const& broken)
{
    return broken.Offset();
}

std::string ReasonOf(std::string const& hex)
try
{
    std::string const stream = BytesOf(hex);
    ItemWalk walk(stream);
    while (walk.Next())
    {
    }
    return "";
}
catch (BrokenStream const& broken)
{
    return std::to_string(broken.Offset()) + " " + broken.Reason();
}

std::string const Signed = "09 53 54 49 43 4B 45 54 5F 31 ";
}  // namespace

TEST(ItemWalk, EachItem_BeginsWhereTheLastOneEnds)
{
    std::string const stream = Streams::Job();
    ItemWalk walk(stream, 1000);
    std::vector<unsigned long> offsets;
    unsigned long end = 1000;
    while (walk.Next())
    {
        EXPECT_EQ(walk.Offset(), end);
        end = walk.End();
        offsets.push_back(walk.Offset() - 1000);
    }
    EXPECT_EQ(offsets, (std::vector<unsigned long>{0, 10, 21, 23, 29, 32, 39, 45, 51, 52, 55, 57, 60, 61}));
    EXPECT_EQ(end, 1000 + stream.size());
}

TEST(ItemWalk, AllTagForms_AreMeasured)
{
    std::string const stream =
        BytesOf(Signed + "10 01 61" + "18 00 00 01 62" + "70 02 68 69" + "B8 00 00 03" + "40");
    ItemWalk walk(stream);
    while (walk.Next())
    {
    }
    EXPECT_EQ(walk.End(), stream.size());
    EXPECT_EQ(walk.Current().pos, 1);
    EXPECT_EQ(walk.Current().key, "b");
}

TEST(ItemWalk, Errors_TellTheirItemInTheWordsOfTheReader)
{
    EXPECT_EQ(ReasonOf("40"), "0 Signature not found");
    EXPECT_EQ(ReasonOf("09 53 54 49 43 4B 45 54 5F 32"), "0 Wrong signature");
    EXPECT_EQ(ReasonOf("09 53"), "0 Unexpected EOF");
    EXPECT_EQ(ReasonOf(Signed + "E5"), "10 Invalid tag");
    EXPECT_EQ(ReasonOf(Signed + "01 61 43 00 00 00"), "12 Invalid number size");
    EXPECT_EQ(ReasonOf(Signed + "01 61 49 78 00 00 00 00 00 00 00 00"), "12 Unexpected POLY64_");
    EXPECT_EQ(ReasonOf(Signed + "20"), "10 Unexpected EOT 1");
    EXPECT_EQ(ReasonOf(Signed + "21 80"), "10 Unexpected EOT 2");
    EXPECT_EQ(ReasonOf(Signed + "22 C0 00"), "10 Unexpected EOT 4");
    EXPECT_EQ(ReasonOf(Signed + "7F FF"), "10 Unexpected EOF");
}

TEST(Whole, EachBeginningOfAStream_AsTheLibrarySaysAndBreaksInside)
{
    for (std::string const& whole : {Streams::Job(), Streams::Container()})
        for (std::size_t size = 0; size <= whole.size(); ++size)
        {
            std::string const cut = whole.substr(0, size);
            bool const isGood = IsContainer(cut) ? MTICKET_BINSTREAM::Check(cut.data(), size)
                                                 : STICKET_BINSTREAM::Check(cut.data(), size);
            auto const broken = Break(cut);
            EXPECT_EQ(broken.has_value(), !isGood) << size;
            EXPECT_LT(broken.value_or(0), size == 0 ? 1 : size) << size;
        }
}

TEST(Whole, EachByteOfAStreamChanged_AsTheLibrarySays)
{
    for (std::string const& whole : {Streams::Job(), Streams::Container()})
        for (std::size_t at = 0; at < whole.size(); ++at)
            for (int byte = 0; byte < 256; ++byte)
            {
                std::string changed = whole;
                changed[at] = static_cast<char>(byte);
                ExactBytes const bytes(changed);
                std::string_view const view(static_cast<char const*>(bytes.Data()), bytes.Size());
                bool isWhole = true;
                try
                {
                    if (IsContainer(view))
                    {
                        OperationWalk walk(view);
                        while (walk.Next())
                        {
                        }
                    }
                    MustBeWhole(view);
                }
                catch (BrokenStream const& broken)
                {
                    isWhole = false;
                    EXPECT_LT(broken.Offset(), whole.size());
                }
                bool const isGood = IsContainer(view) ? MTICKET_BINSTREAM::Check(view.data(), view.size())
                                                      : STICKET_BINSTREAM::Check(view.data(), view.size());
                EXPECT_EQ(isWhole, isGood) << at << ' ' << byte;
            }
}

TEST(Detect, Kinds_AreToldByTheFirstTenBytes)
{
    EXPECT_STREQ(Detect("").name, "empty");
    EXPECT_STREQ(Detect(Streams::Signature()).name, "single-ticket stream");
    EXPECT_STREQ(Detect("MTICKET_1").name, "container stream");
    EXPECT_STREQ(Detect("\x09STICKET_").name, "neither kind of ticket stream");
    EXPECT_FALSE(Detect("hello").isStream);
    EXPECT_TRUE(Detect("").isStream);
}
