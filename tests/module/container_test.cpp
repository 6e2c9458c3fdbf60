// The container contract, kept by the container of a session and by the fake that other tests use in its
// place; and what is the bundle's own about its containers.
#include "tests/module/ModuleUnderTest.h"

#include "comgui/testing/ContainerContract.h"
#include "comgui/testing/ContainerFake.h"
#include "tests/support/Files.h"
#include <stdexcept>
#include <thread>
#include <vector>

using comgui::test::CONTAINER_MAKER;
using comgui::test::CONTAINER_SUBJECT;
using comgui::test::ContainerContract;
using comgui::test::ContainerFake;

namespace
{
class FAKE_SUBJECT : public CONTAINER_SUBJECT
{
public:
    FAKE_SUBJECT() { m_fake.AddTicket(type, id); }
    MTICKET_ACCESS const* Access() override { return m_fake.Access(); }

private:
    ContainerFake m_fake;
};

// The first paper of a new site.
class BUNDLE_SUBJECT : public CONTAINER_SUBJECT
{
public:
    BUNDLE_SUBJECT() : m_access(m_module.Container(m_module.LogIn()))
    {
        if (!m_access)
            throw std::runtime_error("the demo administrator cannot log in");
        type = 12;
    }
    MTICKET_ACCESS const* Access() override { return m_access; }

private:
    MODULE_AT_SITE m_module;
    MTICKET_ACCESS const* m_access;
};

template <typename Subject>
std::unique_ptr<CONTAINER_SUBJECT> New()
{
    return std::make_unique<Subject>();
}
}  // namespace

INSTANTIATE_TEST_SUITE_P(Containers, ContainerContract,
                         testing::Values(CONTAINER_MAKER{"Fake", New<FAKE_SUBJECT>},
                                         CONTAINER_MAKER{"Bundle", New<BUNDLE_SUBJECT>}),
                         [](auto const& maker) { return std::string(maker.param.name); });

class Containers : public ModuleTest
{
protected:
    int ReadInt(MTICKET_ACCESS const* access, int type, int id, char const* key, int pos = -1) const
    {
        int value = -1;
        access->MGETPARAMETER(access->Instance, type, id, key, PARAM_INT, &value, pos);
        return value;
    }
    int WriteInt(MTICKET_ACCESS const* access, int type, int id, char const* key, int value,
                 int pos = -1) const
    {
        return access->MSETPARAMETER(access->Instance, type, id, key, PARAM_INT, &value, pos);
    }
};

TEST_F(Containers, AWrite_IsSeenByEverySession)
{
    auto const* const admin = Container(LogIn());
    auto const* const other = Container(LogIn("operator", "operator"));
    ASSERT_TRUE(admin && other);
    EXPECT_NE(admin, other);
    EXPECT_TRUE(WriteInt(admin, 3, 1, "Test/K", 7));
    EXPECT_EQ(ReadInt(other, 3, 1, "Test/K"), 7);
}

TEST_F(Containers, TheSystemTicket_IsForAdministratorsToWrite)
{
    auto const* const admin = Container(LogIn());
    auto const* const other = Container(LogIn("operator", "operator"));
    ASSERT_TRUE(admin && other);
    EXPECT_EQ(WriteInt(other, 0, 0, "Test/K", 8), 0);
    EXPECT_TRUE(WriteInt(admin, 0, 0, "Test/K", 7));
    EXPECT_EQ(ReadInt(other, 0, 0, "Test/K"), 7);
}

TEST_F(Containers, AChangeOfTheSystemTicket_IsMirroredInItsFile)
{
    auto const* const admin = Container(LogIn());
    ASSERT_TRUE(admin);
    EXPECT_TRUE(WriteInt(admin, 0, 0, "Test/Mirrored", 4711));
    std::string const text = ContentOf(folder.Path() / "site" / "tickets" / "SYS_0000.xml");
    EXPECT_NE(text.find("Test/Mirrored"), std::string::npos);
    EXPECT_NE(text.find("4711"), std::string::npos);
}

TEST_F(Containers, AfterLogout_EverySlotAnswers0)
{
    void* const hSession = LogIn();
    auto const* const access = Container(hSession);
    ASSERT_TRUE(access);
    EXPECT_TRUE(WriteInt(access, 3, 1, "Test/K", 7));
    EXPECT_EQ(module->LogoutEntry(module.Instance(), hSession), 0);
    int value = 42;
    GETMULTIPAR reads[] = {{"Test/K", PARAM_INT, 0, &value, -1, true, {}}, {}};
    SETMULTIPAR writes[] = {{"Test/K", PARAM_INT, 0, &value, -1, true, {}}, {}};
    EXPECT_EQ(access->MGETPARAMETER(access->Instance, 3, 1, "Test/K", PARAM_INT, &value, -1), 0);
    EXPECT_EQ(access->MGETMULTIPAR(access->Instance, 3, 1, reads), 0);
    EXPECT_FALSE(reads[0].ok);
    EXPECT_EQ(WriteInt(access, 3, 1, "Test/K", 8), 0);
    EXPECT_EQ(access->MSETMULTIPAR(access->Instance, 3, 1, writes), 0);
    EXPECT_FALSE(writes[0].ok);
    EXPECT_EQ(access->MOPERATION(access->Instance, 3, 1, MTICKET_OP_DELETE, nullptr), 0);
    EXPECT_EQ(access->MWALKTICKETS(access->Instance, nullptr, nullptr, 3), 0);
    EXPECT_EQ(access->MENDISNOTIF(access->Instance, 3, 1, 0, true, nullptr), 0);
    EXPECT_EQ(value, 42);
    EXPECT_EQ(ReadInt(Container(LogIn()), 3, 1, "Test/K"), 7);
}

TEST_F(Containers, ANullInstance_IsRefused)
{
    auto const* const access = Container(LogIn());
    ASSERT_TRUE(access);
    int value = 42;
    EXPECT_EQ(access->MGETPARAMETER(nullptr, 3, 1, "Test/K", PARAM_INT, &value, -1), 0);
    EXPECT_EQ(access->MSETPARAMETER(nullptr, 3, 1, "Test/K", PARAM_INT, &value, -1), 0);
    EXPECT_EQ(access->MOPERATION(nullptr, 3, 1, MTICKET_OP_DELETE, nullptr), 0);
}

TEST_F(Containers, UnknownOperations_Answer0AndLeaveTheirArgument)
{
    auto const* const access = Container(LogIn());
    ASSERT_TRUE(access);
    for (int const code : {-1, 2, 7, 99, 105, 108, 111, 1000})
    {
        TICKET_OP op(MTICKET_OP_DELETE);
        op.SetInt(code);
        int argument = 42;
        EXPECT_EQ(access->MOPERATION(access->Instance, 3, 1, op, &argument), 0) << code;
        EXPECT_EQ(argument, 42);
    }
}

TEST_F(Containers, ManyThreadsOnOneContainer_ReadWholeValues)
{
    auto const* const access = Container(LogIn("operator", "operator"));
    ASSERT_TRUE(access);
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i)
        threads.emplace_back(
            [&, i]
            {
                for (int step = 0; step < 50; ++step)
                {
                    std::string const text(static_cast<std::size_t>(30 + step), static_cast<char>('a' + i));
                    EXPECT_TRUE(access->MSETPARAMETER(access->Instance, 3, 1, "Test/T", PARAM_STRING,
                                                      text.c_str(), -1));
                    char const* read = nullptr;
                    ASSERT_TRUE(
                        access->MGETPARAMETER(access->Instance, 3, 1, "Test/T", PARAM_STRING, &read, -1));
                    EXPECT_EQ(std::string(read).find_first_not_of(read[0]), std::string::npos);
                }
            });
    for (std::thread& thread : threads)
        thread.join();
}
