// Random servers, mappings and paths against the rules, written down as plainly as they can be.
#include "tests/folders/FolderRows.h"
#include "tests/folders/FolderServer.h"
#include <gtest/gtest.h>
#include <optional>
#include <random>
#include <vector>

namespace
{
std::string With(std::string text, char from, char to)
{
    for (std::size_t i = 0; i < text.size(); ++i)
        if (text[i] == from)
            text[i] = to;
    return text;
}

class PLAIN_TRANSLATOR
{
public:
    struct MAPPING
    {
        std::string key;
        std::string variable;
        std::string folder;
    };

    int flags = 3;
    std::vector<MAPPING> mappings;

    std::string Encode(std::string const& path) const
    {
        if (flags != 2 && flags != 3)
            return path;
        std::string const copy = With(path, '\\', '/');
        std::size_t longest = 0;
        std::string result = path;
        for (MAPPING const& mapping : mappings)
        {
            std::string const& folder = mapping.folder;
            bool const isInside = copy == folder || (copy.size() > folder.size() &&
                                                     copy.substr(0, folder.size() + 1) == folder + "/");
            if (!isInside || folder.size() <= longest)
                continue;
            longest = folder.size();
            result = "$(" + mapping.variable + ")" + copy.substr(longest);
        }
        return result;
    }

    std::string Encode(std::string const& key, std::string const& relative) const
    {
        for (MAPPING const& mapping : mappings)
            if (mapping.key == key)
                return EncodeV(mapping.variable, relative);
        return relative;
    }

    std::string EncodeV(std::string const& variable, std::string const& relative) const
    {
        if (flags != 2 && flags != 3)
            return relative;
        std::string const rest = With(relative, '\\', '/');
        return "$(" + variable + ")" + (rest.empty() || rest.substr(0, 1) == "/" ? "" : "/") + rest;
    }

    std::string Decode(std::string const& path, bool backslashes) const
    {
        if (flags != 1 && flags != 3)
            return path;
        char const from = backslashes ? '/' : '\\';
        char const to = backslashes ? '\\' : '/';
        if (!IsVariableForm(path))
            return With(path, from, to);
        std::size_t const end = path.substr(2).find(')');
        if (end == std::string::npos || end == 0)
            return path;
        for (MAPPING const& mapping : mappings)
            if (mapping.variable == path.substr(2, end))
                return With(mapping.folder + path.substr(end + 3), from, to);
        return path;
    }

    void Set(std::string const& variable, std::optional<std::string> const& folder)
    {
        for (std::size_t i = 0; i < mappings.size(); ++i)
        {
            if (mappings[i].variable != variable)
                continue;
            if (folder)
                mappings[i].folder = *folder;
            else
                mappings.erase(mappings.begin() + static_cast<std::ptrdiff_t>(i));
            return;
        }
        if (folder)
            mappings.push_back({"", variable, *folder});
    }

    // False if it would never end.
    bool Load(int useFolders, std::array<std::string, FolderRows.size()> const& values)
    {
        mappings.clear();
        flags = useFolders;
        for (std::size_t i = 0; flags != 0 && i < values.size(); ++i)
        {
            if (values[i].empty())
                continue;
            std::string folder = With(values[i], '\\', '/');
            if (folder.back() == '/')
                folder.pop_back();
            for (; IsVariableForm(folder); folder = Decode(folder, false))
                if (Decode(folder, false) == folder)
                    return false;
            mappings.push_back({FolderRows[i].key, FolderRows[i].variable, folder});
        }
        return true;
    }

private:
    static bool IsVariableForm(std::string const& text)
    {
        return text.size() > 3 && text.substr(0, 2) == "$(";
    }
};

class RandomFolders : public testing::Test
{
protected:
    std::size_t Below(std::size_t end) { return random() % end; }

    // Short, so that paths and folders meet often.
    std::string Path()
    {
        static char const* const pieces[] = {"/",   "/", "/a", "/a", "/b", "/ab", "\\", "\\a",
                                             "\\b", "a", "b",  "$(", ")",  "C:",  "$()"};
        std::string path;
        for (std::size_t count = Below(6); count > 0; --count)
            path += pieces[Below(std::size(pieces))];
        return path;
    }

    std::string Variable()
    {
        static char const* const more[] = {"X", "Y", "", "temp", "a/b", "a\\b", "(", ")"};
        std::size_t const i = Below(std::size(more) + 6);
        return i < std::size(more) ? more[i] : FolderRows[Below(6)].variable;
    }

    std::string AnyPath() { return Below(3) == 0 ? "$(" + Variable() + ")" + Path() : Path(); }

    // Loads both, unless they would never end.
    bool Load()
    {
        std::array<std::string, FolderRows.size()> values;
        for (std::size_t i = 0; i < values.size(); ++i)
        {
            if (Below(3) != 0)
                values[i] = i > 0 && Below(4) == 0
                                ? std::string("$(") + FolderRows[Below(i)].variable + ")" + Path()
                                : Path();
            server.SetFolder(FolderRows[i].key, values[i]);
        }
        int const flags = Below(4) == 0 ? static_cast<int>(Below(3)) : 3;
        server.SetFlags(flags);
        if (!plain.Load(flags, values))
            return false;
        server.systemTicket.container.calls.clear();
        folders ? folders->Load() : void(folders = server.Translator());
        return true;
    }

    void SetSomething()
    {
        std::string const variable = Variable();
        std::string const folder = Path();
        bool const isRemoval = Below(4) == 0;
        folders->SetFolderVariable(variable.c_str(), isRemoval ? nullptr : folder.c_str());
        plain.Set(variable, isRemoval ? std::nullopt : std::optional(folder));
    }

    // A path that is inside some folder more often than not.
    std::string LikelyPath()
    {
        if (plain.mappings.empty() || Below(4) == 0)
            return AnyPath();
        std::string const path = plain.mappings[Below(plain.mappings.size())].folder + Path();
        return Below(2) == 0 ? With(path, '/', '\\') : path;
    }

    void Compare()
    {
        std::string const path = LikelyPath();
        bool const backslashes = Below(2) == 0;
        char const* const key = FolderRows[Below(8)].key;
        std::string const variable = Variable();
        EXPECT_EQ(folders->IsEnabled(), plain.flags != 0);
        EXPECT_EQ(folders->Encode(path), plain.Encode(path)) << path;
        EXPECT_EQ(folders->Decode(path, backslashes), plain.Decode(path, backslashes)) << path;
        if (plain.flags & 2)
        {
            EXPECT_EQ(folders->Encode(key, path), plain.Encode(key, path)) << key << ' ' << path;
        }
        EXPECT_EQ(folders->EncodeV(variable.c_str(), path), plain.EncodeV(variable, path)) << path;
        encoded += plain.Encode(path) != path;
        decoded += plain.Decode(path, backslashes) != path;
    }

    std::mt19937 random{51};
    FolderServer server;
    std::unique_ptr<clFOLDER_VARIABLES> folders;
    PLAIN_TRANSLATOR plain;
    int encoded = 0;
    int decoded = 0;
};
}  // namespace

TEST_F(RandomFolders, AreTranslatedAsThePlainRulesSay)
{
    constexpr int Paths = 100;
    int loaded = 0;
    for (int run = 0; run < 2000 && !HasFailure(); ++run)
    {
        if (!Load())
            continue;
        ++loaded;
        for (int i = 0; i < Paths && !HasFailure(); ++i)
        {
            if (i % 10 == 9)
                SetSomething();
            Compare();
        }
    }
    // Not much of all this may be idle.
    EXPECT_GT(loaded, 100);
    EXPECT_GT(encoded, loaded * Paths / 10) << loaded;
    EXPECT_GT(decoded, loaded * Paths / 10) << loaded;
}
