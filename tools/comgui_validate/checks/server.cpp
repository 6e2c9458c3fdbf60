// What can be asked of a server without a session.
#include "tools/comgui_validate/Trial.h"
#include <arpa/inet.h>
#include <ifaddrs.h>
#include <memory>
#include <netinet/in.h>

namespace validate
{
namespace
{
std::string PlaceOf(Options const& options)
{
    return Quoted(options.host) + ", " + std::to_string(options.port) + ")";
}

void Alive(Trial& trial)
{
    Module& module = trial.GetModule();
    Options const& options = trial.GetOptions();
    trial.Calling("IsAliveEntry(instance, " + PlaceOf(options));
    trial.ExpectZero("S1", module.table.IsAliveEntry(module.instance, options.host.c_str(), options.port));
}

void Nobody(Trial& trial)
{
    Module& module = trial.GetModule();
    int const port = NumberOf(trial.Option("dead-port", "1")).value_or(1);
    trial.Calling("IsAliveEntry(instance, \"localhost\", " + std::to_string(port) + ")");
    trial.ExpectFailure("S1", module.table.IsAliveEntry(module.instance, "localhost", port));
    trial.Calling("IsAliveEntry(instance, \"server.invalid\", " + std::to_string(trial.GetOptions().port) +
                  ")");
    trial.ExpectFailure(
        "S1", module.table.IsAliveEntry(module.instance, "server.invalid", trial.GetOptions().port));
}

// IPv4, in the byte order of the machine.
std::vector<unsigned int> OwnAddresses()
{
    ifaddrs* first = nullptr;
    if (getifaddrs(&first) != 0)
        throw Skipped("the addresses of this machine cannot be listed");
    std::unique_ptr<ifaddrs, decltype(&freeifaddrs)> const all(first, freeifaddrs);
    std::vector<unsigned int> addresses;
    for (ifaddrs const* each = all.get(); each; each = each->ifa_next)
        if (each->ifa_addr && each->ifa_addr->sa_family == AF_INET)
            addresses.push_back(ntohl(reinterpret_cast<sockaddr_in const*>(each->ifa_addr)->sin_addr.s_addr));
    return addresses;
}

std::string Dotted(unsigned int address)
{
    std::string text;
    for (int shift = 24; shift >= 0; shift -= 8)
        text += std::to_string(address >> shift & 255) + (shift ? "." : "");
    return text;
}

void LocalAddress(Trial& trial)
{
    Module& module = trial.GetModule();
    Options const& options = trial.GetOptions();
    trial.Calling("GetLocalAddressEntry(instance, \"server.invalid\", 1)");
    (void)module.table.GetLocalAddressEntry(module.instance, "server.invalid", 1);
    if (module.table.IsAliveEntry(module.instance, options.host.c_str(), options.port) != 0)
        throw Skipped("no server answers; see server.alive");
    trial.Calling("GetLocalAddressEntry(instance, " + PlaceOf(options));
    unsigned int const address =
        module.table.GetLocalAddressEntry(module.instance, options.host.c_str(), options.port);
    bool isOwn = false;
    for (unsigned int const own : OwnAddresses())
        isOwn = isOwn || own == address;
    trial.Expect("S2", isOwn, Dotted(address), "an address of this machine");
}
}  // namespace

std::vector<Check> ServerChecks()
{
    return {{"server.alive", Alive}, {"server.nobody", Nobody}, {"server.local-address", LocalAddress}};
}
}  // namespace validate
