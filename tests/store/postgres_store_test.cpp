// What the PostgreSQL store promises beyond the contract of all stores: its schema, and broken connections.
#include "standin/server/store/postgres/PostgresStore.h"

#include "tests/store/PostgresSite.h"
#include "tests/support/sanitizers.h"
#include <gmock/gmock.h>

using namespace standin;
using namespace std::chrono_literals;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

namespace
{
class SiteInASchema : public StoreSite
{
public:
    explicit SiteInASchema(StoreLimits const& limits) { m_options.limits = limits; }
    std::unique_ptr<Store> Open() override { return m_schema.Open(m_options); }

private:
    PostgresSchema m_schema;
    PostgresOptions m_options;
};

std::unique_ptr<StoreSite> MakeSite(StoreLimits const& limits)
{
    return std::make_unique<SiteInASchema>(limits);
}
}  // namespace

INSTANTIATE_TEST_SUITE_P(Postgres, StoreContract, testing::Values(STORE_ENGINE{"Schema", MakeSite, true}),
                         [](auto const& engine) { return std::string(engine.param.name); });
