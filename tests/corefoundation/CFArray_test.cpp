#include "comgui/testing/TemporaryFolder.h"
#include "tests/corefoundation/Held.h"
#include "tests/corefoundation/UUIDTexts.h"
#include "tests/support/BundleOnDisk.h"

#include <gtest/gtest.h>

using comgui::test::TemporaryFolder;

namespace
{
// The only arrays that there are: the factories of a type.
class CFArray : public testing::Test
{
protected:
    CFArray()
    {
        bundle.AddFactory(typeA, factory3, "RecordingFactory");
        bundle.AddFactory(typeA, factory1, "RecordingFactory");
        bundle.AddFactory(typeA, factory2, "RecordingFactory");
        plugIn = OpenPlugIn(bundle.Path());
        array = FactoriesOf(plugIn, typeA);
    }

    TemporaryFolder const folder;
    BundleOnDisk bundle{folder.Path()};
    Held<CFPlugInRef> plugIn;
    Held<CFArrayRef> array;
};

TEST_F(CFArray, Elements_StandInTheOrderOfTheInfoPlist)
{
    ASSERT_EQ(CFArrayGetCount(array.get()), 3);
    EXPECT_TRUE(IsUUID(CFArrayGetValueAtIndex(array.get(), 0), factory3));
    EXPECT_TRUE(IsUUID(CFArrayGetValueAtIndex(array.get(), 1), factory1));
    EXPECT_TRUE(IsUUID(CFArrayGetValueAtIndex(array.get(), 2), factory2));
}

TEST_F(CFArray, Elements_OutliveThePlugIn)
{
    plugIn.reset();
    EXPECT_TRUE(IsUUID(CFArrayGetValueAtIndex(array.get(), 0), factory3));
}

TEST_F(CFArray, RetainedElement_OutlivesTheArray)
{
    Held<CFUUIDRef> const element(static_cast<CFUUIDRef>(CFRetain(CFArrayGetValueAtIndex(array.get(), 1))));
    array.reset();
    EXPECT_TRUE(IsUUID(element.get(), factory1));
}

TEST_F(CFArray, RetainedArray_NeedsTwoReleases)
{
    CFRetain(array.get());
    CFRelease(array.get());
    EXPECT_EQ(CFArrayGetCount(array.get()), 3);
}

using CFArrayOfStandIn = CFArray;  // the lines of which are its own

TEST_F(CFArrayOfStandIn, IndexPastTheEnd_EndsTheProgram)
{
    EXPECT_DEATH(CFArrayGetValueAtIndex(array.get(), 3), "outside the array");
}

TEST_F(CFArrayOfStandIn, NegativeIndex_EndsTheProgram)
{
    EXPECT_DEATH(CFArrayGetValueAtIndex(array.get(), -1), "outside the array");
}

TEST_F(CFArrayOfStandIn, NullArray_EndsTheProgram)
{
    EXPECT_DEATH(CFArrayGetCount(nullptr), "CFArrayGetCount of a null reference");
}

TEST(CFReleaseOfStandIn, NullReference_EndsTheProgram)
{
    EXPECT_DEATH(CFRelease(nullptr), "CFRelease of a null reference");  // NOLINT: the null is meant
}

TEST(CFRetainOfStandIn, NullReference_EndsTheProgram)
{
    EXPECT_DEATH(CFRetain(nullptr), "CFRetain of a null reference");  // NOLINT: the null is meant
}

TEST(CFRetain, AnyObject_GivesItBack)
{
    auto const string = MakeString("text");
    Held<CFTypeRef> const again(CFRetain(string.get()));
    EXPECT_EQ(again.get(), string.get());
}
}  // namespace
