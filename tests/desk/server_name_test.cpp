// Servers as people type them.
#include "desk/model/ServerName.h"

#include <gmock/gmock.h>

using namespace desk;
using testing::ElementsAre;
using testing::SizeIs;

namespace
{
// "host port"; empty if the text names no server.
std::string Parsed(std::string_view text)
{
    auto const server = ServerFromText(text);
    return server ? server->host + " " + std::to_string(server->port) : "";
}
}  // namespace

TEST(ServerName, MayHaveAPort)
{
    EXPECT_EQ(Parsed("press-7"), "press-7 50000");
    EXPECT_EQ(Parsed("press-7:1"), "press-7 1");
    EXPECT_EQ(Parsed("press-7:65535"), "press-7 65535");
    EXPECT_EQ(Parsed("10.0.0.7:50001"), "10.0.0.7 50001");
}

TEST(ServerName, MayBeAnAddressWithColons)
{
    EXPECT_EQ(Parsed("fe80::1"), "fe80::1 50000");
    EXPECT_EQ(Parsed("[fe80::1]"), "fe80::1 50000");
    EXPECT_EQ(Parsed("[fe80::1]:77"), "fe80::1 77");
}

TEST(ServerName, MayHaveSpacesAround) { EXPECT_EQ(Parsed("  press \t\n"), "press 50000"); }

TEST(ServerName, ThatIsNone_IsNone)
{
    for (char const* const text : {"", "  ", ":5", "press:", "press:0", "press:65536", "press:x", "press:5x",
                                   "press:99999999999", "press:-1", "press: 5", "two words", "[fe80::1",
                                   "[]:5", "[fe80::1]5", "[fe80::1]:", "[fe80::1]x:5"})
        EXPECT_EQ(Parsed(text), "") << text;
}

TEST(ServerName, AsText_IsReadBack)
{
    for (char const* const text : {"press", "press:1", "fe80::1", "[fe80::1]:77"})
        EXPECT_EQ(TextOf(*ServerFromText(text)), text);
}

TEST(ServerName, IsRemembered_TheNewestFirst_EachOnce)
{
    std::vector<std::string> servers{"a", "b", "c"};
    Remember(servers, "b");
    EXPECT_THAT(servers, ElementsAre("b", "a", "c"));
    for (int i = 0; i < 20; ++i)
        Remember(servers, std::to_string(i));
    EXPECT_THAT(servers, SizeIs(10));
    EXPECT_EQ(servers.front(), "19");
}
