// By which a store knows the site that it has opened, whenever it connects again: another one may have taken
// its place meanwhile, or a server that has not got all of its changes. For any thread.
#pragma once

#include "standin/server/store/postgres/Connection.h"
#include <mutex>
#include <optional>
#include <string>
#include <vector>

namespace standin::postgres
{
class Identity
{
public:
    // To be called on each new connection before anything else is done there. known: the newest change that
    // this program knows of. Throws UnusableStore if this is not the site of the calls before, or if its
    // history up to that change is another one.
    void Check(Connection& connection, Sequence known, Clock::time_point deadline);

private:
    // The changes behind one were made while that server ran.
    struct ERA
    {
        long long server;
        Sequence since;

        bool operator==(ERA const& other) const { return server == other.server && since == other.since; }
    };
    using Eras = std::vector<ERA>;  // in the order of their servers' starts
    struct SITE
    {
        std::string number;
        long long schema;
        Sequence newest;
        Eras eras;
    };

    static SITE Found(Connection& connection, Clock::time_point deadline);
    static Eras Before(Eras eras, Sequence known);
    void Compare(SITE const& found, Sequence known, std::string const& name) const;

    std::mutex m_lock;
    std::optional<SITE> m_site;
};
}  // namespace standin::postgres
