#include "standin/server/sessions/Password.h"

#include <gtest/gtest.h>
#include <stdexcept>

namespace Password = standin::Password;

TEST(Password, Hash_IsYescryptAndSaysNothingOfThePassword)
{
    std::string const hash = Password::Hash("secret");
    EXPECT_EQ(hash.substr(0, 3), "$y$");
    EXPECT_EQ(hash.find("secret"), std::string::npos);
}

TEST(Password, Hash_TwiceOfOnePassword_HasTwoSalts)
{
    EXPECT_NE(Password::Hash("secret"), Password::Hash("secret"));
}

TEST(Password, Verify_KnowsItsPasswordAndNoOther)
{
    std::string const hash = Password::Hash("secret");
    EXPECT_TRUE(Password::Verify("secret", hash));
    EXPECT_FALSE(Password::Verify("Secret", hash));
    EXPECT_FALSE(Password::Verify("secret ", hash));
    EXPECT_FALSE(Password::Verify("", hash));
}

TEST(Password, Verify_EmptyPassword_MatchesItsOwnHashOnly)
{
    EXPECT_TRUE(Password::Verify("", Password::Hash("")));
    EXPECT_FALSE(Password::Verify("x", Password::Hash("")));
}

TEST(Password, Verify_TakesTheCostThatStandsInTheHash)
{
    // The cheapest cost that yescrypt knows
    EXPECT_TRUE(Password::Verify(
        "secret", "$y$j75$k0xKNpTyyqUCI91fDe6.t/$AOpC.H0fgbhxHFr1JrsgxvC18fxDi2KoRtFQgKObcJ0"));
}

TEST(Password, Verify_MalformedHash_MatchesNothing)
{
    std::string const good = Password::Hash("secret");
    for (std::string const& hash :
         {std::string(), std::string("*0"), std::string("*1"), std::string("secret"), std::string("$y$"),
          std::string("$y$j9T$"), good.substr(0, good.size() - 1), good + "x", good.substr(1), "x" + good})
    {
        EXPECT_FALSE(Password::Verify("secret", hash)) << hash;
        EXPECT_FALSE(Password::Verify("", hash)) << hash;
        EXPECT_FALSE(Password::Verify(hash, hash)) << hash;
    }
}

TEST(Password, Verify_EveryPrefixOfAHash_MatchesNothing)
{
    std::string const hash = Password::Hash("secret");
    for (std::size_t size = 0; size < hash.size(); size += 7)
        EXPECT_FALSE(Password::Verify("secret", hash.substr(0, size))) << size;
}

TEST(Password, ZeroByte_IsRefused)
{
    std::string const password("secret\0more", 11);
    EXPECT_THROW(Password::Hash(password), std::runtime_error);
    EXPECT_FALSE(Password::Verify(password, Password::Hash("secret")));
}

TEST(Password, TooLong_IsRefused)
{
    EXPECT_TRUE(Password::Verify(std::string(511, 'x'), Password::Hash(std::string(511, 'x'))));
    EXPECT_THROW(Password::Hash(std::string(512, 'x')), std::runtime_error);
    EXPECT_NO_THROW(Password::VerifyNobody(std::string(512, 'x')));
}
