// The templates below the lists of the views, called as a host may call them, and what their tables look like
// to a module.
#include "comgui/access/list_templates.h"

#include "comgui/access/STICKET_MODIFY.h"
#include "tests/access/ListFamilies.h"
#include <gmock/gmock.h>

using comgui::test::CALL;

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
template <typename Family>
class ListTemplate : public ListsInBothFamilies<Family>
{
};

// What a table looked like to the slot.
struct SEEN
{
    char const* key;
    PARAM_TYPE type;
    void const* value;
    int pos;

    friend bool operator==(SEEN const&, SEEN const&) = default;
};
std::vector<SEEN> seen;

template <typename Record>
int Look(void*, int, int, Record* table)
{
    seen.clear();
    for (; table->key; ++table)
    {
        EXPECT_FALSE(table->ok);
        EXPECT_EQ(table->reserved12, 0);
        seen.push_back({table->key, table->type, table->value, table->pos});
        table->ok = true;
    }
    EXPECT_EQ(table->type, PARAM_NONE);
    EXPECT_EQ(table->value, nullptr);
    EXPECT_EQ(table->pos, 0);
    return 1;
}

// A type has a public member if a view takes a vector of it. TicketAndKey: what stands before the vector.
template <typename View, typename T, typename... TicketAndKey>
concept TakesVector = requires(View const& view, std::vector<T>& list, TicketAndKey... ticketAndKey)
{
    view.GetVectorParameter(ticketAndKey..., list);
}
|| requires(View const& view, std::vector<T>& list, TicketAndKey... ticketAndKey)
{
    view.SetVectorParameter(ticketAndKey..., list);
};
static_assert(TakesVector<STICKET_READ, wxString, char const*>);
static_assert(TakesVector<MTICKET_MODIFY, void*, int, int, char const*>);
static_assert(!TakesVector<STICKET_READ, char const*, char const*>);
static_assert(!TakesVector<STICKET_MODIFY, char const*, char const*>);
static_assert(!TakesVector<MTICKET_READ, char const*, int, int, char const*>);
static_assert(!TakesVector<MTICKET_MODIFY, char const*, int, int, char const*>);
}  // namespace

TYPED_TEST_SUITE(ListTemplate, Families);

TYPED_TEST(ListTemplate, WriteOfNumbers_HandsOverTheirAddressesUnderOneKey)
{
    this->ticket.fake.Access()->MSETMULTIPAR = Look<SETMULTIPAR>;
    std::vector<int> const numbers = {10, 20, 30};
    EXPECT_TRUE(this->ticket.xSetVector(numbers));
    ASSERT_EQ(seen.size(), 3u);
    char const* const key = seen[0].key;
    EXPECT_STREQ(key, "k");
    std::vector<SEEN> const expected = {{key, PARAM_INT, &numbers[0], -1},
                                        {key, PARAM_INT, &numbers[1], 1},
                                        {key, PARAM_INT, &numbers[2], 2}};
    EXPECT_EQ(seen, expected);
    EXPECT_TRUE(this->ticket.xSetArray(numbers.data(), 3));
    EXPECT_EQ(seen, expected);
}

TYPED_TEST(ListTemplate, WriteOfPointers_HandsOverThePointers)
{
    this->ticket.fake.Access()->MSETMULTIPAR = Look<SETMULTIPAR>;
    std::vector<void*> const pointers = {this, nullptr};
    EXPECT_TRUE(this->ticket.xSetVector(pointers));
    ASSERT_EQ(seen.size(), 2u);
    std::vector<SEEN> const expected = {{seen[0].key, PARAM_POINTER, this, -1},
                                        {seen[0].key, PARAM_POINTER, nullptr, 1}};
    EXPECT_EQ(seen, expected);
    EXPECT_TRUE(this->ticket.xSetArray(pointers.data(), 2));
    EXPECT_EQ(seen, expected);
}

TYPED_TEST(ListTemplate, WriteOfTexts_HandsOverTheTexts)
{
    this->ticket.fake.Access()->MSETMULTIPAR = Look<SETMULTIPAR>;
    std::vector<char const*> const texts = {"a", "b"};
    EXPECT_TRUE(this->ticket.xSetVector(texts));
    ASSERT_EQ(seen.size(), 2u);
    EXPECT_THAT(seen, ElementsAre(SEEN{seen[0].key, PARAM_STRING, texts[0], -1},
                                  SEEN{seen[0].key, PARAM_STRING, texts[1], 1}));
}

TYPED_TEST(ListTemplate, Read_HandsOverTheAddressOfEachElementOfTheCaller)
{
    this->ticket.StoreList(std::vector<void*>{this, this});
    this->ticket.fake.Access()->MGETMULTIPAR = Look<GETMULTIPAR>;
    std::vector<void*> out;
    EXPECT_TRUE(this->ticket.xGetVector(out));
    ASSERT_EQ(out.size(), 2u);
    std::vector<SEEN> const expected = {{seen[0].key, PARAM_POINTER, &out[0], 0},
                                        {seen[0].key, PARAM_POINTER, &out[1], 1}};
    EXPECT_EQ(seen, expected);
    EXPECT_TRUE(this->ticket.xGetArray(out.data(), 2));
    EXPECT_EQ(seen, expected);
}

TYPED_TEST(ListTemplate, ReadOfTexts_GivesTheModulesOwn)
{
    this->ticket.Store("a", -1);
    this->ticket.Store("$(A)/x", 1);
    std::vector<char const*> out = {"old"};
    EXPECT_TRUE(this->ticket.xGetVector(out));
    ASSERT_EQ(out.size(), 2u);
    EXPECT_STREQ(out[0], "a");
    EXPECT_STREQ(out[1], "$(A)/x");
}

TYPED_TEST(ListTemplate, ReadOfNullTexts_KeepsThem)
{
    this->ticket.Store("a", -1);
    this->ticket.fake.nullTexts = true;
    std::vector<char const*> out;
    EXPECT_TRUE(this->ticket.xGetVector(out));
    EXPECT_THAT(out, ElementsAre(nullptr));
}

TYPED_TEST(ListTemplate, WriteOfNoPointers_DeletesTheKey)
{
    EXPECT_TRUE(this->ticket.xSetVector(std::vector<char const*>()));
    EXPECT_TRUE(this->ticket.xSetVector(std::vector<void*>()));
    EXPECT_TRUE(this->ticket.xSetArray(static_cast<void* const*>(nullptr), 0));
    CALL const erase = this->ticket.Delete();
    EXPECT_THAT(this->calls, ElementsAre(erase, erase, erase));
}
