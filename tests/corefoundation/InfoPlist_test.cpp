#include "tests/corefoundation/Held.h"
#include "tests/corefoundation/UUIDTexts.h"
#include "tests/support/BundleOnDisk.h"
#include "tests/support/TemporaryFolder.h"

#include <cstdlib>
#include <functional>
#include <gtest/gtest.h>
#include <plist/plist.h>
#include <sys/stat.h>

namespace
{
std::string BinaryOf(std::string const& xml)
{
    plist_t root = nullptr;
    plist_from_xml(xml.data(), static_cast<uint32_t>(xml.size()), &root);
    char* bytes = nullptr;
    uint32_t size = 0;
    plist_to_bin(root, &bytes, &size);
    std::string binary(bytes, size);
    std::free(bytes);
    plist_free(root);
    return binary;
}

class InfoPlist : public testing::Test
{
protected:
    InfoPlist()
    {
        bundle.AddFactory(typeA, factory1, "RecordingFactory");
        bundle.AddFactory(typeA, factory2, "RecordingFactory");
    }

    // The number of factories of typeA in the bundle with that Info.plist.
    CFIndex FactoriesWith(std::string const& content)
    {
        bundle.WriteInfo(content);
        auto const plugIn = OpenPlugIn(bundle.Path());
        EXPECT_TRUE(plugIn);
        auto const factories = FactoriesOf(plugIn, typeA);
        return factories ? CFArrayGetCount(factories.get()) : 0;
    }

    // The good Info.plist with one piece of its text replaced by another.
    std::string With(std::string const& piece, std::string const& replacement) const
    {
        std::string text = bundle.Info();
        std::size_t const at = text.find(piece);
        EXPECT_NE(at, std::string::npos) << piece;
        return text.replace(at, piece.size(), replacement);
    }

    TemporaryFolder const folder;
    BundleOnDisk bundle{folder.Path()};
};

TEST_F(InfoPlist, Xml_IsRead) { EXPECT_EQ(FactoriesWith(bundle.Info()), 2); }

TEST_F(InfoPlist, Binary_IsRead)
{
    std::string const binary = BinaryOf(bundle.Info());
    ASSERT_EQ(binary.substr(0, 8), "bplist00");
    EXPECT_EQ(FactoriesWith(binary), 2);
}

TEST_F(InfoPlist, KeysThatMeanNothingHere_AreOverlooked)
{
    EXPECT_EQ(FactoriesWith(With("<dict>", "<dict><key>CFBundleName</key><string>ComGUI</string>")), 2);
}

TEST_F(InfoPlist, FactoryWithMalformedUUID_IsLeftOutOfItsType)
{
    std::string const entry = std::string("<string>") + factory1;
    EXPECT_EQ(FactoriesWith(With(entry, entry + "0")), 1);
}

TEST_F(InfoPlist, FactoryThatIsNoText_IsLeftOutOfItsType)
{
    EXPECT_EQ(FactoriesWith(With("<array>", "<array><integer>7</integer>")), 2);
}

TEST_F(InfoPlist, TypeWithMalformedUUID_IsLeftOut)
{
    EXPECT_EQ(FactoriesWith(With(std::string("<key>") + typeA, "<key>type A")), 0);
}

TEST_F(InfoPlist, TypeThatIsNoArray_IsLeftOut)
{
    std::string text = With("<array>", "<dict><key>factories</key><array>");
    text.replace(text.find("</array>"), 8, "</array></dict>");
    EXPECT_EQ(FactoriesWith(text), 0);
}

TEST_F(InfoPlist, TypeWithEmptyArray_HasNoFactories)
{
    EXPECT_EQ(FactoriesWith(With("<dict>\n<key>" + std::string(typeA) + "</key>",
                                 "<dict><key>" + std::string(typeA) + "</key><array/><key>other</key>")),
              0);
}

TEST_F(InfoPlist, FactoryWhoseFunctionIsNoText_IsLeftOutAndMakesNoInstance)
{
    bundle.WriteInfo(With("<string>RecordingFactory</string>", "<true/>"));
    auto const plugIn = OpenPlugIn(bundle.Path());
    auto const factories = FactoriesOf(plugIn, typeA);
    ASSERT_TRUE(factories);
    EXPECT_EQ(CFArrayGetCount(factories.get()), 1);
    testing::internal::CaptureStderr();
    EXPECT_EQ(MakeInstance(factory1, typeA), nullptr);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
}

// What stderr gets when the bundle is opened, as it is on disk now.
std::string StderrOfOpening(BundleOnDisk const& bundle)
{
    testing::internal::CaptureStderr();
    EXPECT_TRUE(OpenPlugIn(bundle.Path()));
    return testing::internal::GetCapturedStderr();
}

std::string CannotRead(BundleOnDisk const& bundle)
{
    return "CoreFoundation: " + bundle.Path().string() +
           ": cannot read its Info.plist, so it has no factories; "
           "put a property list, XML or binary, into Contents/Info.plist\n";
}

TEST_F(InfoPlist, Good_OpensSilently) { EXPECT_EQ(StderrOfOpening(bundle), ""); }

TEST_F(InfoPlist, MissingFile_IsSaidInOneLine)
{
    std::filesystem::remove(bundle.InfoFile());
    EXPECT_EQ(StderrOfOpening(bundle), CannotRead(bundle));
}

TEST_F(InfoPlist, FolderOfThatName_IsSaidInOneLine)
{
    std::filesystem::remove(bundle.InfoFile());
    std::filesystem::create_directory(bundle.InfoFile());
    EXPECT_EQ(StderrOfOpening(bundle), CannotRead(bundle));
}

TEST_F(InfoPlist, PipeOfThatName_DoesNotBlockAndIsSaidInOneLine)
{
    std::filesystem::remove(bundle.InfoFile());
    ASSERT_EQ(mkfifo(bundle.InfoFile().c_str(), 0600), 0);
    EXPECT_EQ(StderrOfOpening(bundle), CannotRead(bundle));
}

struct CHANGED_INFO
{
    char const* name;
    char const* piece;  // of the good Info.plist, null for all of it
    char const* replacement;
};

class InfoPlistWith : public InfoPlist, public testing::WithParamInterface<CHANGED_INFO>
{
protected:
    std::string Content() const
    {
        auto const [name, piece, replacement] = GetParam();
        return piece ? With(piece, replacement) : replacement;
    }
};

using UnreadableInfoPlist = InfoPlistWith;

TEST_P(UnreadableInfoPlist, GivesABundleWithoutFactories) { EXPECT_EQ(FactoriesWith(Content()), 0); }

TEST_P(UnreadableInfoPlist, IsSaidInOneLine)
{
    bundle.WriteInfo(Content());
    EXPECT_EQ(StderrOfOpening(bundle), CannotRead(bundle));
}

auto const NameOfInfo = [](auto const& fact) { return std::string(fact.param.name); };

INSTANTIATE_TEST_SUITE_P(
    Facts, UnreadableInfoPlist,
    testing::Values(
        CHANGED_INFO{"Nothing", nullptr, ""}, CHANGED_INFO{"PlainText", nullptr, "no property list"},
        CHANGED_INFO{"OtherXml", nullptr, "<?xml version=\"1.0\"?><html><body/></html>"},
        CHANGED_INFO{"BinaryMagicAlone", nullptr, "bplist00"},
        CHANGED_INFO{"Array", nullptr, "<plist version=\"1.0\"><array><string>a</string></array></plist>"},
        CHANGED_INFO{"Text", nullptr, "<plist version=\"1.0\"><string>CFBundleExecutable</string></plist>"},
        CHANGED_INFO{"MismatchedTags", "</array>", "</dict>"}),
    NameOfInfo);

using InfoPlistWithoutFactories = InfoPlistWith;

TEST_P(InfoPlistWithoutFactories, GivesABundleAndSaysNothing)
{
    bundle.WriteInfo(Content());
    testing::internal::CaptureStderr();
    auto const plugIn = OpenPlugIn(bundle.Path());
    EXPECT_TRUE(plugIn);
    EXPECT_FALSE(FactoriesOf(plugIn, typeA));
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
}

INSTANTIATE_TEST_SUITE_P(
    Facts, InfoPlistWithoutFactories,
    testing::Values(CHANGED_INFO{"EmptyDictionary", nullptr, "<plist version=\"1.0\"><dict/></plist>"},
                    CHANGED_INFO{"NoFactories", "CFPlugInFactories", "CFPlugInFactory"},
                    CHANGED_INFO{"FactoriesText", "<key>CFPlugInFactories</key>",
                                 "<key>CFPlugInFactories</key><string>x</string><key>Other</key>"},
                    CHANGED_INFO{"NoTypes", "CFPlugInTypes", "CFPlugInType"},
                    CHANGED_INFO{"TypesArray", "<key>CFPlugInTypes</key>",
                                 "<key>CFPlugInTypes</key><array/><key>Other</key>"}),
    NameOfInfo);

TEST_F(InfoPlist, OfTheLargestSize_IsRead)
{
    std::string const good = bundle.Info();
    std::string const padding(64UL * 1024 - good.size(), ' ');
    EXPECT_EQ(FactoriesWith(good + padding), 2);
    EXPECT_EQ(FactoriesWith(good + padding + " "), 0);
}

TEST_F(InfoPlist, DeeplyNested_GivesNoFactories)
{
    std::string nested;
    while (nested.size() < 60000)
        nested += "<array>";
    EXPECT_EQ(FactoriesWith("<plist version=\"1.0\">" + nested), 0);
}

TEST_F(InfoPlist, CutBeforeItsDictionaryEnds_GivesNoFactories)
{
    std::string const good = bundle.Info();
    std::size_t const end = good.rfind("</dict>") + std::string("</dict>").size();
    ASSERT_EQ(FactoriesWith(good.substr(0, end)), 2);
    for (std::size_t size = 0; size < end; ++size)
        ASSERT_EQ(FactoriesWith(good.substr(0, size)), 0) << size;
}

TEST_F(InfoPlist, BinaryCutAtAnyByte_GivesNoFactories)
{
    std::string const good = BinaryOf(bundle.Info());
    for (std::size_t size = 0; size < good.size(); ++size)
        ASSERT_EQ(FactoriesWith(good.substr(0, size)), 0) << size;
}

// A changed bit may leave a sound bundle behind, but never one with more than there was.
void ExpectNoMoreFactories(std::string const& good, std::function<CFIndex(std::string const&)> const& count)
{
    ASSERT_EQ(count(good), 2);
    for (std::size_t bit = 0; bit < good.size() * 8; ++bit)
    {
        std::string changed = good;
        changed[bit / 8] = static_cast<char>(changed[bit / 8] ^ (1 << bit % 8));
        ASSERT_LE(count(changed), 2) << bit;
    }
}

TEST_F(InfoPlist, AnyBitChanged_GivesNothingNew)
{
    ExpectNoMoreFactories(bundle.Info(), [this](auto const& content) { return FactoriesWith(content); });
}

TEST_F(InfoPlist, BinaryWithAnyBitChanged_GivesNothingNew)
{
    ExpectNoMoreFactories(BinaryOf(bundle.Info()),
                          [this](auto const& content) { return FactoriesWith(content); });
}
}  // namespace
