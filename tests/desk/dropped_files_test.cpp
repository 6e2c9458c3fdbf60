#include "desk/model/DroppedFiles.h"

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <gtest/gtest.h>
#include <sys/stat.h>

namespace fs = std::filesystem;
using namespace desk;

namespace
{
class Dropped : public testing::Test
{
protected:
    Dropped()
    {
        std::string name = (fs::temp_directory_path() / "dropped-XXXXXX").string();
        m_folder = mkdtemp(name.data());
    }
    ~Dropped() override { fs::remove_all(m_folder); }

    std::string File(std::string const& name, std::string const& content = "x") const
    {
        std::ofstream(m_folder / name) << content;
        return (m_folder / name).string();
    }

    fs::path m_folder;
};

std::vector<Refusal> ReasonsOf(DroppedFiles const& sorted)
{
    std::vector<Refusal> reasons;
    for (RefusedPath const& path : sorted.refused)
        reasons.push_back(path.why);
    return reasons;
}
}  // namespace

TEST_F(Dropped, FilesAreTakenInTheirOrderAndOnce)
{
    std::string const b = File("b");
    std::string const a = File("a \xC3\xBC");
    DroppedFiles const sorted = Sifted({b, a, b});
    EXPECT_EQ(sorted.files, (std::vector<std::string>{b, a}));
    EXPECT_TRUE(sorted.refused.empty());
}

TEST_F(Dropped, EachKindOfOtherThingHasItsReason)
{
    std::string const pipe = (m_folder / "pipe").string();
    ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
    DroppedFiles const sorted =
        Sifted({m_folder.string(), (m_folder / "none").string(), pipe, File("empty", ""), "", File("good")});
    EXPECT_EQ(ReasonsOf(sorted), (std::vector{Refusal::Folder, Refusal::NotThere, Refusal::NoFile,
                                              Refusal::Empty, Refusal::NotThere}));
    EXPECT_EQ(sorted.files.size(), 1U);
    EXPECT_EQ(sorted.refused[0].path, m_folder.string());
}

TEST_F(Dropped, ALinkIsWhatItLeadsTo)
{
    fs::create_symlink(File("real"), m_folder / "link");
    fs::create_directory_symlink(m_folder, m_folder / "loop");
    DroppedFiles const sorted = Sifted({(m_folder / "link").string(), (m_folder / "loop").string()});
    EXPECT_EQ(sorted.files.size(), 1U);
    EXPECT_EQ(ReasonsOf(sorted), std::vector{Refusal::Folder});
}

TEST_F(Dropped, APathThatIsTooLongIsNotThere)
{
    EXPECT_EQ(ReasonsOf(Sifted({"/" + std::string(100000, 'x')})), std::vector{Refusal::NotThere});
}
