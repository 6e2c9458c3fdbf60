#include "comgui/testing/TemporaryFolder.h"
#include "tests/corefoundation/Held.h"
#include "tests/corefoundation/UUIDTexts.h"
#include "tests/support/BundleOnDisk.h"

#include <cstdlib>
#include <functional>
#include <gtest/gtest.h>
#include <plist/plist.h>
#include <sys/stat.h>

using comgui::test::TemporaryFolder;

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

// What only the stand-in promises: to read the file anew each time, how it is said that it cannot be read,
// and where it gives up.
using InfoPlistOfStandIn = InfoPlist;

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

TEST_F(InfoPlist, TypeWithASingleText_HasThatFactory)
{
    std::string text = With("<array>", "");
    for (std::string const& piece :
         {std::string("</array>"), "<string>" + std::string(factory2) + "</string>"})
        text.erase(text.find(piece), piece.size());
    EXPECT_EQ(FactoriesWith(text), 1);
}

TEST_F(InfoPlist, TypeThatIsNeitherArrayNorText_IsLeftOut)
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

TEST_F(InfoPlistOfStandIn, Good_OpensSilently) { EXPECT_EQ(StderrOfOpening(bundle), ""); }

TEST_F(InfoPlistOfStandIn, MissingFile_IsSaidInOneLine)
{
    std::filesystem::remove(bundle.InfoFile());
    EXPECT_EQ(StderrOfOpening(bundle), CannotRead(bundle));
}

TEST_F(InfoPlistOfStandIn, FolderOfThatName_IsSaidInOneLine)
{
    std::filesystem::remove(bundle.InfoFile());
    std::filesystem::create_directory(bundle.InfoFile());
    EXPECT_EQ(StderrOfOpening(bundle), CannotRead(bundle));
}

TEST_F(InfoPlistOfStandIn, PipeOfThatName_DoesNotBlockAndIsSaidInOneLine)
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

using UnreadableInfoPlistOfStandIn = InfoPlistWith;

TEST_P(UnreadableInfoPlistOfStandIn, IsSaidInOneLine)
{
    bundle.WriteInfo(Content());
    EXPECT_EQ(StderrOfOpening(bundle), CannotRead(bundle));
}

auto const NameOfInfo = [](auto const& fact) { return std::string(fact.param.name); };

auto const unreadable = testing::Values(
    CHANGED_INFO{"Nothing", nullptr, ""}, CHANGED_INFO{"PlainText", nullptr, "no property list"},
    CHANGED_INFO{"OtherXml", nullptr, "<?xml version=\"1.0\"?><html><body/></html>"},
    CHANGED_INFO{"BinaryMagicAlone", nullptr, "bplist00"},
    CHANGED_INFO{"Array", nullptr, "<plist version=\"1.0\"><array><string>a</string></array></plist>"},
    CHANGED_INFO{"Text", nullptr, "<plist version=\"1.0\"><string>CFBundleExecutable</string></plist>"},
    CHANGED_INFO{"MismatchedTags", "</array>", "</dict>"},
    CHANGED_INFO{"CutBehindItsDictionary", "</plist>", ""},
    CHANGED_INFO{"BadDate", "<dict>", "<dict><key>Since</key><date>yesterday</date>"},
    CHANGED_INFO{"DateWithoutATime", "<dict>", "<dict><key>Since</key><date>2026-11-23</date>"},
    CHANGED_INFO{"DateDeepInside", "<dict>", "<dict><key>A</key><array><array><date/></array></array>"},
    CHANGED_INFO{"Latin1", "<dict>", "<dict><key>Name</key><string>gr\xFCn</string>"});

INSTANTIATE_TEST_SUITE_P(Facts, UnreadableInfoPlist, unreadable, NameOfInfo);
INSTANTIATE_TEST_SUITE_P(Facts, UnreadableInfoPlistOfStandIn, unreadable, NameOfInfo);

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

TEST_F(InfoPlist, WithAByteOrderMark_IsRead) { EXPECT_EQ(FactoriesWith("\xEF\xBB\xBF" + bundle.Info()), 2); }

TEST_F(InfoPlist, GoodDate_IsOverlooked)
{
    EXPECT_EQ(FactoriesWith(With("<dict>", "<dict><key>Since</key><date>2026-11-23T08:17:26Z</date>")), 2);
}

TEST_F(InfoPlist, OtherLettersThanAscii_AreRead)
{
    EXPECT_EQ(FactoriesWith(With("<dict>", "<dict><key>Name</key><string>gr\xC3\xBCn</string>")), 2);
}

TEST_F(InfoPlist, Large_IsRead)
{
    std::string const padding(1UL << 20, ' ');
    EXPECT_EQ(FactoriesWith(With("<dict>", "<dict><key>Name</key><string>" + padding + "</string>")), 2);
}

TEST_F(InfoPlist, LargeBinary_IsRead)
{
    std::string const padding(1UL << 20, 'x');
    EXPECT_EQ(
        FactoriesWith(BinaryOf(With("<dict>", "<dict><key>Name</key><string>" + padding + "</string>"))), 2);
}

TEST_F(InfoPlistOfStandIn, Above16MiB_GivesNoFactories)
{
    std::string const good = bundle.Info();
    std::string const padding(16UL * 1024 * 1024 - good.size(), ' ');
    EXPECT_EQ(FactoriesWith(good + padding), 2);
    EXPECT_EQ(FactoriesWith(good + padding + " "), 0);
}

std::string Nested(int depth, std::string const& inside)
{
    std::string text;
    for (int i = 0; i < depth; ++i)
        text += "<array>";
    text += inside;
    for (int i = 0; i < depth; ++i)
        text += "</array>";
    return text;
}

TEST_F(InfoPlist, NestedAsMuchAsAnybodyNests_IsRead)
{
    EXPECT_EQ(FactoriesWith(With("<dict>", "<dict><key>Name</key>" + Nested(100, ""))), 2);
}

TEST_F(InfoPlistOfStandIn, NestedTooDeeply_GivesNoFactories)
{
    EXPECT_EQ(FactoriesWith(With("<dict>", "<dict><key>Name</key>" + Nested(100'000, ""))), 0);
}

// Each array of a binary property list names the next by its number.
std::string NestedBinary(std::uint64_t objects)
{
    std::string text = "bplist00";
    std::string offsets;
    auto const put = [](std::string& where, std::uint64_t number, int bytes)
    {
        while (bytes-- > 0)
            where += static_cast<char>(number >> 8 * bytes);
    };
    for (std::uint64_t i = 0; i < objects; ++i)
    {
        put(offsets, text.size(), 4);
        text += i + 1 < objects ? '\xA1' : '\xA0';  // an array with one element, or none
        if (i + 1 < objects)
            put(text, i + 1, 4);
    }
    std::uint64_t const table = text.size();
    text += offsets;
    put(text, 0, 6);
    put(text, 0x0404, 2);  // bytes of an offset, of a number
    put(text, objects, 8);
    put(text, 0, 8);  // the outermost one
    put(text, table, 8);
    return text;
}

TEST_F(InfoPlistOfStandIn, BinaryNestedTooDeeply_GivesNoFactories)
{
    EXPECT_EQ(FactoriesWith(NestedBinary(8192)), 0);  // still read, and no dictionary
    EXPECT_EQ(FactoriesWith(NestedBinary(1'000'000)), 0);
}

TEST_F(InfoPlistOfStandIn, DeeplyNested_GivesNoFactories)
{
    std::string nested;
    while (nested.size() < 60000)
        nested += "<array>";
    EXPECT_EQ(FactoriesWith("<plist version=\"1.0\">" + nested), 0);
}

TEST_F(InfoPlistOfStandIn, CutAnywhere_GivesNoFactories)
{
    std::string const good = bundle.Info();
    std::size_t const end = good.rfind("</plist>") + std::string("</plist>").size();
    ASSERT_EQ(FactoriesWith(good.substr(0, end)), 2);
    for (std::size_t size = 0; size < end; ++size)
        ASSERT_EQ(FactoriesWith(good.substr(0, size)), 0) << size;
}

TEST_F(InfoPlistOfStandIn, BinaryCutAtAnyByte_GivesNoFactories)
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

TEST_F(InfoPlistOfStandIn, AnyBitChanged_GivesNothingNew)
{
    ExpectNoMoreFactories(bundle.Info(), [this](auto const& content) { return FactoriesWith(content); });
}

TEST_F(InfoPlistOfStandIn, BinaryWithAnyBitChanged_GivesNothingNew)
{
    ExpectNoMoreFactories(BinaryOf(bundle.Info()),
                          [this](auto const& content) { return FactoriesWith(content); });
}
}  // namespace
