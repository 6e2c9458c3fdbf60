// The slots of containers and tickets above an author's functions: handles, openings, and how long texts
// live.
#include "comgui/ticket/TICKET_ID.h"
#include "comgui/ticket/TICKET_OP.h"
#include "tests/module_kit/FakePlugIn.h"
#include <bit>
#include <gmock/gmock.h>

using testing::Each;
using testing::ElementsAre;
using testing::IsEmpty;
namespace plugin = comgui::plugin;

namespace
{
std::string const LongText = "a text that lies on the heap, since it is longer than any short string";

class Slots : public PlugInTest
{
protected:
    Slots() : hSession(LogIn()), container(ContainerOf(hSession)), ticket(NewTicket()) {}

    int Set(char const* key, int value) const
    {
        return container->MSETPARAMETER(container->Instance, 3, ticket.id, key, PARAM_INT, &value, -1);
    }
    int SetText(char const* key, std::string const& text) const
    {
        return container->MSETPARAMETER(container->Instance, 3, ticket.id, key, PARAM_STRING, text.c_str(),
                                        -1);
    }
    int Get(void* instance, char const* key) const
    {
        int value = -1;
        container->MGETPARAMETER(instance, 3, ticket.id, key, PARAM_INT, &value, -1);
        return value;
    }
    char const* Text(char const* key) const
    {
        char const* text = nullptr;
        container->MGETPARAMETER(container->Instance, 3, ticket.id, key, PARAM_STRING, &text, -1);
        return text;
    }
    int Operate(int id, TICKET_OP op, void* arg) const
    {
        return container->MOPERATION(container->Instance, 3, id, op, arg);
    }
    STICKET_ACCESS const* Open() const
    {
        STICKET_ACCESS const* access = nullptr;
        EXPECT_EQ(Operate(ticket.id, MTICKET_OP_OPEN, &access), 1);
        return access;
    }
    int Close() const
    {
        bool flag = false;
        return Operate(ticket.id, MTICKET_OP_CLOSE, &flag);
    }
    static int IntIn(STICKET_ACCESS const& access, char const* key)
    {
        int value = -1;
        access.SGETPARAMETER(access.Instance, key, PARAM_INT, &value, -1);
        return value;
    }

    void* hSession;
    MTICKET_ACCESS const* container;
    fake::Address ticket;
};
}  // namespace

TEST_F(Slots, AnInstanceThatIsNone_IsAnsweredWith0AndNotFollowed)
{
    ASSERT_EQ(Set("K", 7), 1);
    STICKET_ACCESS const* const opened = Open();
    fake::Trouble::Set([](std::string const& called) { fake::Log::Add(called); });
    void* const unmapped = std::bit_cast<void*>(std::uintptr_t{0x10});
    void* const i[] = {nullptr,   unmapped, &ticket,
                       hInstance, hSession, const_cast<MTICKET_ACCESS*>(container)};
    for (void* const foreign : i)
    {
        EXPECT_EQ(Get(foreign, "K"), -1);
        EXPECT_EQ(container->MGETMULTIPAR(foreign, 3, ticket.id, nullptr), 0);
        EXPECT_EQ(container->MWALKTICKETS(foreign, nullptr, nullptr, 3), 0);
        EXPECT_EQ(container->MSETPARAMETER(foreign, 3, ticket.id, "K", PARAM_NONE, nullptr, -1), 0);
        EXPECT_EQ(container->MSETMULTIPAR(foreign, 3, ticket.id, nullptr), 0);
        EXPECT_EQ(container->MOPERATION(foreign, 3, ticket.id, MTICKET_OP_DELETE, nullptr), 0);
        EXPECT_EQ(container->MENDISNOTIF(foreign, 3, ticket.id, 1, false, nullptr), 0);
        EXPECT_EQ(container->MCREATETICKET(foreign, 3, 777, nullptr), nullptr);
        int value = -1;
        EXPECT_EQ(opened->SGETPARAMETER(foreign, "K", PARAM_INT, &value, -1), 0);
        EXPECT_EQ(opened->SGETMULTIPAR(foreign, nullptr), 0);
        EXPECT_EQ(opened->SWALKPARAMETERS(foreign, nullptr, nullptr, "", 8000), 0);
        EXPECT_EQ(opened->SSETPARAMETER(foreign, "K", PARAM_NONE, nullptr, -1), 0);
        EXPECT_EQ(opened->SSETMULTIPAR(foreign, nullptr), 0);
        EXPECT_EQ(opened->SOPTION(foreign, STICKET_OP_WHOAMI, &value), 0);
    }
    EXPECT_EQ(opened->SGETPARAMETER(container->Instance, "K", PARAM_INT, &ticket, -1), 0);
    EXPECT_EQ(Get(opened->Instance, "K"), -1);
    EXPECT_THAT(fake::Log::Take(), Each("Around"));  // of the module, which may keep account of such calls
    EXPECT_EQ(Get(container->Instance, "K"), 7);
}

TEST_F(Slots, AfterTheLogout_TheTablesStayAndAnswer0)
{
    ASSERT_EQ(Set("K", 7), 1);
    STICKET_ACCESS const* const opened = Open();
    ASSERT_EQ(IntIn(*opened, "K"), 7);
    EXPECT_EQ(table.LogoutEntry(hInstance, hSession), 0);
    fake::Trouble::Set([](std::string const& called) { fake::Log::Add(called); });
    fake::Log::Take();
    EXPECT_EQ(Get(container->Instance, "K"), -1);
    EXPECT_EQ(Set("K", 8), 0);
    STICKET_ACCESS const* access = nullptr;
    EXPECT_EQ(Operate(ticket.id, MTICKET_OP_OPEN, &access), 0);
    EXPECT_EQ(IntIn(*opened, "K"), -1);
    EXPECT_EQ(opened->SSETPARAMETER(opened->Instance, "K", PARAM_NONE, nullptr, -1), 0);
    EXPECT_THAT(fake::Log::Take(), Each("Around"));
}

TEST_F(Slots, AfterTheLogout_NoRecordOfATableIsOk)
{
    STICKET_ACCESS const* const opened = Open();
    EXPECT_EQ(table.LogoutEntry(hInstance, hSession), 0);
    int value = 42;
    GETMULTIPAR reads[] = {
        {"K", PARAM_INT, 0, &value, -1, true, {}}, {"L", PARAM_INT, 0, &value, -1, true, {}}, {}};
    SETMULTIPAR writes[] = {
        {"K", PARAM_INT, 0, &value, -1, true, {}}, {"L", PARAM_INT, 0, &value, -1, true, {}}, {}};
    auto const spoil = [&] { reads[0].ok = reads[1].ok = writes[0].ok = writes[1].ok = true; };
    auto const isAnyOk = [&] { return reads[0].ok || reads[1].ok || writes[0].ok || writes[1].ok; };
    EXPECT_EQ(container->MGETMULTIPAR(container->Instance, 3, ticket.id, reads), 0);
    EXPECT_EQ(container->MSETMULTIPAR(container->Instance, 3, ticket.id, writes), 0);
    EXPECT_FALSE(isAnyOk());
    spoil();
    EXPECT_EQ(opened->SGETMULTIPAR(opened->Instance, reads), 0);
    EXPECT_EQ(opened->SSETMULTIPAR(opened->Instance, writes), 0);
    EXPECT_FALSE(isAnyOk());
    EXPECT_EQ(value, 42);
}

TEST_F(Slots, ATicket_HasOneTableHoweverOftenItIsOpened)
{
    STICKET_ACCESS const* const one = Open();
    EXPECT_EQ(Open(), one);
    ASSERT_EQ(Set("K", 7), 1);
    EXPECT_EQ(Close(), 1);
    EXPECT_EQ(IntIn(*one, "K"), 7);
    EXPECT_EQ(Close(), 1);
    EXPECT_EQ(IntIn(*one, "K"), -1);
    EXPECT_EQ(Close(), 0);
    EXPECT_EQ(Open(), one);
    EXPECT_EQ(IntIn(*one, "K"), 7);
}

TEST_F(Slots, AClosedTicket_AnswersTablesWithoutSuccess)
{
    ASSERT_EQ(Set("K", 7), 1);
    STICKET_ACCESS const* const one = Open();
    EXPECT_EQ(Close(), 1);
    int value = 42;
    GETMULTIPAR reads[] = {{"K", PARAM_INT, 0, &value, -1, true, {}}, {}};
    SETMULTIPAR writes[] = {{"K", PARAM_INT, 0, &value, -1, true, {}}, {}};
    EXPECT_EQ(one->SGETMULTIPAR(one->Instance, reads), 0);
    EXPECT_EQ(one->SSETMULTIPAR(one->Instance, writes), 0);
    EXPECT_FALSE(reads[0].ok || writes[0].ok);
    EXPECT_EQ(value, 42);
    EXPECT_EQ(Get(container->Instance, "K"), 7);
}

TEST_F(Slots, ATextThatWasRead_StaysUntilTheNextCallAndLonger)
{
    ASSERT_EQ(SetText("K", LongText), 1);
    char const* const text = Text("K");
    ASSERT_TRUE(text);
    for (int i = 0; i < 1000; ++i)
    {
        ASSERT_EQ(SetText("K", std::string(LongText.size(), static_cast<char>('a' + i % 26))), 1);
        ASSERT_TRUE(Text("K"));
    }
    EXPECT_EQ(text, LongText);
}

TEST_F(Slots, ReadingOneTextAgainAndAgain_TakesOneAddress)
{
    ASSERT_EQ(SetText("K", LongText), 1);
    char const* const text = Text("K");
    for (int i = 0; i < 1000; ++i)
        ASSERT_EQ(Text("K"), text);
}

TEST_F(Slots, TheTextsOfATable_AreGoodTogether)
{
    constexpr std::size_t Count = 20'000;
    std::vector<std::string> keys;
    std::vector<char const*> texts(Count);
    std::vector<GETMULTIPAR> records(Count + 1);
    for (std::size_t i = 0; i < Count; ++i)
        keys.push_back("K" + std::to_string(i));
    for (std::size_t i = 0; i < Count; ++i)
    {
        ASSERT_EQ(SetText(keys[i].c_str(), LongText + keys[i]), 1);
        records[i] = {keys[i].c_str(), PARAM_STRING, 0, &texts[i], -1, false, {}};
    }
    EXPECT_EQ(container->MGETMULTIPAR(container->Instance, 3, ticket.id, records.data()), 1);
    for (std::size_t i = 0; i < Count; ++i)
    {
        ASSERT_TRUE(records[i].ok);
        ASSERT_EQ(texts[i], LongText + keys[i]);
    }
}

TEST_F(Slots, AddressesThatAreNoTickets_DoNotReachTheAuthor)
{
    fake::Trouble::Set([](std::string const& called) { fake::Log::Add(called); });
    int value = 1;
    STICKET_ACCESS const* access = nullptr;
    for (auto const& [type, id] : {std::pair{-1, -1}, {100, 0}, {3, -3}, {3, 1 << 24}, {INT_MIN, INT_MAX}})
    {
        void* const i = container->Instance;
        EXPECT_EQ(container->MGETPARAMETER(i, type, id, "K", PARAM_INT, &value, -1), 0);
        EXPECT_EQ(container->MSETPARAMETER(i, type, id, "K", PARAM_INT, &value, -1), 0);
        EXPECT_EQ(container->MOPERATION(i, type, id, MTICKET_OP_OPEN, &access), 0);
        EXPECT_EQ(container->MOPERATION(i, type, id, MTICKET_OP_DELETE, nullptr), 0);
        EXPECT_EQ(container->MOPERATION(i, type, id, STICKET_OP_SET_PARTIAL, nullptr), 0);
        EXPECT_EQ(container->MCREATETICKET(i, type, id, nullptr), nullptr);
    }
    EXPECT_EQ(
        container->MWALKTICKETS(
            container->Instance, [](void*, int, int, STICKET_ACCESS const*) { return true; }, nullptr, 100),
        0);
    EXPECT_THAT(fake::Log::Take(), IsEmpty());
}

TEST_F(Slots, OperationsWithoutAPlaceForTheirAnswer_AreRefused)
{
    EXPECT_EQ(Operate(ticket.id, MTICKET_OP_OPEN, nullptr), 0);
    EXPECT_EQ(Operate(TICKET_ID_NEXT, MTICKET_OP_CREATE_NEXT, nullptr), 0);
    EXPECT_EQ(container->MOPERATION(container->Instance, -1, -1, MTICKET_OP_FOLDER_VARIABLES, nullptr), 0);
}

TEST_F(Slots, OperationsThatTheKitDoesNotKnow_AreTheAuthors)
{
    EXPECT_EQ(Operate(ticket.id, static_cast<MTICKET_OP>(105), nullptr), 1);
    EXPECT_EQ(Operate(ticket.id, static_cast<MTICKET_OP>(108), nullptr), 0);
}

TEST_F(Slots, APartialTicket_IsLimitedToTheKeysOfTheTable)
{
    char const* const keys[] = {"K", nullptr};
    EXPECT_EQ(Operate(ticket.id, STICKET_OP_SET_PARTIAL, const_cast<char const**>(keys)), 1);
    EXPECT_EQ(Operate(99'999, STICKET_OP_SET_PARTIAL, const_cast<char const**>(keys)), 0);
}

TEST_F(Slots, MCREATETICKET_MakesATicketOnceAndOpensIt)
{
    int const id = ticket.id + 1;
    STICKET_ACCESS const* const made = container->MCREATETICKET(container->Instance, 3, id, nullptr);
    ASSERT_NE(made, nullptr);
    int const value = 7;
    EXPECT_EQ(made->SSETPARAMETER(made->Instance, "K", PARAM_INT, &value, -1), 1);
    EXPECT_EQ(IntIn(*made, "K"), 7);
    EXPECT_EQ(container->MCREATETICKET(container->Instance, 3, id, nullptr), nullptr);
}

TEST_F(Slots, MWALKTICKETS_GivesEachTicketItsTable)
{
    ASSERT_EQ(Set("K", 7), 1);
    struct SEEN
    {
        int wanted;
        int value = 0;
    } seen{ticket.id};
    auto const look = [](void* context, int type, int id, STICKET_ACCESS const* access)
    {
        auto& its = *static_cast<SEEN*>(context);
        EXPECT_EQ(type, 3);
        if (id == its.wanted)
            its.value = IntIn(*access, "K");
        return id != its.wanted;
    };
    EXPECT_EQ(container->MWALKTICKETS(container->Instance, look, &seen, 3), 1);
    EXPECT_EQ(seen.value, 7);
}

TEST_F(Slots, ATranslatorOfFolders_IsNotOfferedWithoutOne)
{
    void* out = this;
    EXPECT_EQ(container->MOPERATION(container->Instance, -1, -1, MTICKET_OP_FOLDER_VARIABLES, &out), 0);
    EXPECT_EQ(out, this);
}

namespace
{
// An author's container with nothing but reads, and a value that is never there.
class BareContainer : public plugin::Container
{
public:
    using plugin::Container::Container;
    bool Exists(plugin::Address) override { return true; }
    plugin::Value Read(plugin::Address, std::string_view key, int pos) override
    {
        return key == "K" && pos == 0 ? plugin::Value(7) : plugin::Value();
    }
};
}  // namespace

TEST(BareContainerOfTheKit, WhatIsNotOverridden_IsRefused)
{
    plugin::Session session;
    BareContainer bare(session);
    MTICKET_ACCESS const& access = *bare.Access();
    int value = -1;
    unsigned long count = 0;
    EXPECT_EQ(access.MGETPARAMETER(access.Instance, 3, 1, "K", PARAM_INT, &value, -1), 1);
    EXPECT_EQ(value, 7);
    EXPECT_EQ(access.MGETPARAMETER(access.Instance, 3, 1, "K", PARAM_COUNT, &count, -1), 1);
    EXPECT_EQ(count, 1u);
    EXPECT_EQ(access.MSETPARAMETER(access.Instance, 3, 1, "K", PARAM_INT, &value, -1), 0);
    SETMULTIPAR writes[] = {{"K", PARAM_INT, 0, &value, -1, true, {}}, {}};
    EXPECT_EQ(access.MSETMULTIPAR(access.Instance, 3, 1, writes), 1);
    EXPECT_FALSE(writes[0].ok);
    EXPECT_EQ(access.MOPERATION(access.Instance, 3, -4, MTICKET_OP_CREATE_NEXT, &value), 0);
    EXPECT_EQ(access.MOPERATION(access.Instance, 3, 1, MTICKET_OP_DELETE, nullptr), 0);
    EXPECT_EQ(access.MOPERATION(access.Instance, 3, 1, STICKET_OP_SET_PARTIAL, nullptr), 0);
    EXPECT_EQ(access.MOPERATION(access.Instance, 3, 1, static_cast<MTICKET_OP>(105), nullptr), 0);
    char const* const keys[] = {nullptr};
    EXPECT_EQ(access.MENDISNOTIF(access.Instance, 3, 1, 0, true, keys), 0);
    EXPECT_EQ(access.MCREATETICKET(access.Instance, 3, 2, keys), nullptr);
}
