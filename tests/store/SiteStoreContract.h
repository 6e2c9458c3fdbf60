// What every store that lasts promises to who opens it as a site, as one suite that each engine passes:
//
//     INSTANTIATE_TEST_SUITE_P(Sqlite, SiteStoreContract, testing::Values(LASTING_ENGINE{...}));
#pragma once

#include "standin/server/store/SiteStore.h"
#include "tests/store/StoreContract.h"

// One site of an engine, empty at first and gone with the object.
class LastingSite
{
public:
    virtual ~LastingSite() = default;

    // A handle more, which counts as a program of its own.
    virtual std::unique_ptr<standin::SiteStore> Open(bool keepOpening) = 0;
};

struct LASTING_ENGINE
{
    char const* name;
    std::unique_ptr<LastingSite> (*makeSite)();

    friend void PrintTo(LASTING_ENGINE const& engine, std::ostream* out) { *out << engine.name; }
};

class SiteStoreContract : public testing::TestWithParam<LASTING_ENGINE>
{
protected:
    static constexpr standin::TicketAddress Job{3, 1};
    static constexpr standin::TicketAddress OtherJob{3, 2};

    std::unique_ptr<standin::SiteStore> Open(bool keepOpening = false) const
    {
        return site->Open(keepOpening);
    }

    std::unique_ptr<LastingSite> site = GetParam().makeSite();
};
