#include "standin/corefoundation/CountedObject.h"

#include <gtest/gtest.h>
#include <string>

namespace
{
// Tells of its end, and whether somebody could still have become an owner then.
class Mortal : public comgui::detail::CountedObject
{
public:
    explicit Mortal(std::string& story) : m_story(story) {}
    ~Mortal() override { m_story += RetainUnlessGone() ? "retained" : "gone"; }

private:
    std::string& m_story;
};

class CountedObject : public testing::Test
{
protected:
    std::string story;
    Mortal* const object = new Mortal(story);
};

// The analyzer does not count owners: it takes every Release for the last one.
// NOLINTBEGIN(clang-analyzer-cplusplus.NewDelete)
TEST_F(CountedObject, LastRelease_DestroysIt)
{
    object->Retain();
    object->Release();
    EXPECT_EQ(story, "");
    object->Release();
    EXPECT_NE(story, "");
}

TEST_F(CountedObject, RetainUnlessGone_OwnedObject_MakesOneMoreOwner)
{
    EXPECT_TRUE(object->RetainUnlessGone());
    object->Release();
    EXPECT_EQ(story, "");
    object->Release();
}
// NOLINTEND(clang-analyzer-cplusplus.NewDelete)

TEST_F(CountedObject, RetainUnlessGone_ObjectBeingDestroyed_IsRefused)
{
    object->Release();
    EXPECT_EQ(story, "gone");
}
}  // namespace
