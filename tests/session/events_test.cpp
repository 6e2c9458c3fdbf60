// From kind and code to the event's id. Row by row, and everything between the rows.
#include "tests/session/Receiver.h"

#include <map>

namespace
{
// Kind and code to id; a code of AnyCode stands for all.
constexpr int AnyCode = -12345;
std::map<std::pair<int, int>, int> const Ids = {
    {{1, 0}, 1000044},  {{1, 2}, 1000200},        {{1, 3}, 1000004},        {{1, 5}, 1000034},
    {{1, 6}, 1000024},  {{1, 7}, 1000034},        {{1, 12}, 1000094},       {{1, 17}, 1000014},
    {{4, 2}, 1000226},  {{4, 3}, 1000002},        {{4, 7}, 1000036},        {{4, 17}, 1000012},
    {{5, 2}, 1000225},  {{5, 3}, 1000003},        {{5, 7}, 1000035},        {{5, 12}, 1000093},
    {{5, 17}, 1000013}, {{6, AnyCode}, 10000015}, {{9, AnyCode}, 10000110}, {{11, AnyCode}, 1000101},
};

int ExpectedId(int kind, int code)
{
    for (int const asked : {code, AnyCode})
        if (auto const row = Ids.find({kind, asked}); row != Ids.end())
            return row->second;
    return 0;
}

class Events : public Receiver
{
};
}  // namespace

TEST_F(Events, EachKindAndCode_GivesItsIdOrNone)
{
    std::vector<int> expected;
    for (int kind = -2; kind <= 14; ++kind)
        for (int code = -1; code <= 20; ++code)
        {
            if (kind == 0)
                continue;  // stays in hand, see the receiver's tests
            Queue(kind, code);
            if (int const id = ExpectedId(kind, code))
                expected.push_back(id);
        }
    Run();
    WaitUntilHandled();
    EXPECT_EQ(EventIds(), expected);
}
