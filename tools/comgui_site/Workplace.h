// A folder of its own for a program that makes something large before that gets its name. It goes with
// everything in it, and what programs that were killed have left of the same kind goes before.
#pragma once

#include "standin/server/files/Descriptor.h"
#include <filesystem>

namespace comgui_site
{
// Gives a file that is whole its name, and returns when it is on the disk under it. Throws FileError; Trouble
// if there is a file of that name which it may not replace.
void GiveName(std::filesystem::path const& made, std::filesystem::path const& file, bool mayReplace);

class Workplace
{
public:
    // Beside that file, under a name of TemporaryFor. Throws FileError.
    explicit Workplace(std::filesystem::path const& file);
    ~Workplace();
    Workplace(Workplace const&) = delete;
    Workplace& operator=(Workplace const&) = delete;

    // To work in. The one around it is locked, and a site that is opened here locks its own.
    std::filesystem::path Folder() const { return m_folder / "site"; }
    std::filesystem::path Database() const { return Folder() / "site.db"; }

private:
    bool Make(std::filesystem::path const& file);

    std::filesystem::path m_folder;
    standin::Descriptor m_lock;  // held while somebody works there
};
}  // namespace comgui_site
