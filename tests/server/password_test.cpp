#include "standin/server/sessions/Password.h"

#include <gmock/gmock.h>
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

TEST(Password, Secret_LeavesNothingInMemory)
{
    using Password::Secret;
    alignas(Secret) unsigned char room[sizeof(Secret)];  // a short text lies in the object itself
    auto* const secret = new (room) Secret("s3cret-word");
    EXPECT_EQ(secret->Text(), "s3cret-word");
    secret->~Secret();
    std::string const left(reinterpret_cast<char const*>(room), sizeof room);
    EXPECT_EQ(left.find("s3cret"), left.npos);
    EXPECT_EQ(left.find("word"), left.npos);
}

TEST(Password, Secret_LeavesNothingWhereItsTextWas)
{
    std::string text = "s3cret-word";
    Password::Secret const secret(std::move(text));
    EXPECT_EQ(std::string(text.data(), text.capacity()), std::string(text.capacity(), '\0'));
}

TEST(PasswordFailures, AfterAFew_WaitLongerAndLonger)
{
    Password::Failures failures;
    Password::Failures::Time now{};
    std::vector<long long> waits;
    for (int i = 0; i < 13; ++i)
        waits.push_back(failures.Note(now += std::chrono::seconds(1)).count());
    EXPECT_THAT(waits, testing::ElementsAre(0, 0, 0, 0, 0, 100, 200, 400, 800, 1600, 3200, 3200, 3200));
}

TEST(PasswordFailures, AfterAQuietMinute_BeginAnew)
{
    Password::Failures failures;
    Password::Failures::Time now{};
    now += std::chrono::hours(1);
    for (int i = 0; i < 8; ++i)
        failures.Note(now);
    EXPECT_GT(failures.Note(now + std::chrono::seconds(60)).count(), 0);
    EXPECT_EQ(failures.Note(now + std::chrono::seconds(121)).count(), 0);
    for (int i = 0; i < 4; ++i)
        EXPECT_EQ(failures.Note(now + std::chrono::seconds(122)).count(), 0) << "five again";
    EXPECT_GT(failures.Note(now + std::chrono::seconds(123)).count(), 0);
}
