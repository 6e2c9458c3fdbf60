#include "standin/server/store/sqlite/SqliteStore.h"

#include "tests/server/MemoryFolder.h"
#include "tests/store/SiteStoreContract.h"

using namespace standin;

namespace
{
class SiteInAFolder : public LastingSite
{
public:
    std::unique_ptr<SiteStore> Open(bool keepOpening) override
    {
        SqliteOptions options;
        options.keepOpening = keepOpening;
        return std::make_unique<SqliteStore>(m_folder.Path(), NoContent, options);
    }

private:
    MemoryFolder m_folder;
};

std::unique_ptr<LastingSite> MakeSite() { return std::make_unique<SiteInAFolder>(); }
}  // namespace

INSTANTIATE_TEST_SUITE_P(Sqlite, SiteStoreContract, testing::Values(LASTING_ENGINE{"Folder", MakeSite}),
                         testing::PrintToStringParamName());
