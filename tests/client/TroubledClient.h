// A client of a plug-in with trouble.
#pragma once

#include "tests/client/Client.h"

#include "comgui/comgui.h"
#include "tests/client/TroubledPlugIn.h"
#include "tests/support/BundleOnDisk.h"
#include <chrono>
#include <dlfcn.h>
#include <memory>
#include <string>
#include <thread>
#include <vector>

class TroubledClient : public Client
{
protected:
    using Clock = std::chrono::steady_clock;

    TroubledClient() : bundle(folder.Path())
    {
        bundle.LinkExecutable(COMGUI_TROUBLED_PLUGIN);
        bundle.AddFactory(COMGUI_PLUGIN_TYPE_UUID, "11111111-2222-3333-4444-555555555555",
                          "TroubledPlugInFactory");
        UtilityObjects::SetPlugInsFolder(folder.Path().native());
        std::destroy_at(&trouble);  // orders of a test before, in the same process
        std::construct_at(&trouble);
    }

    template <typename IsThere>
    static void Await(IsThere const& isThere)
    {
        for (auto const end = Clock::now() + std::chrono::seconds(20); !isThere() && Clock::now() < end;)
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        ASSERT_TRUE(isThere());
    }

    // Words for what happens at the server until there are so many.
    std::vector<std::string> Hear(std::size_t count)
    {
        for (auto const end = Clock::now() + std::chrono::seconds(20);
             heard.size() < count && Clock::now() < end;)
            queue.RunFor(std::chrono::milliseconds(5));
        return heard;
    }

    comgui::Subscription Listen()
    {
        return connection.Subscribe({}, queue.GetExecutor(),
                                    [this](comgui::Event const& event)
                                    {
                                        if (auto const* const lost = std::get_if<comgui::ServerLost>(&event))
                                            heard.push_back("lost: " + lost->error.Text());
                                        else if (auto const* const back =
                                                     std::get_if<comgui::ServerBack>(&event))
                                            heard.push_back(back->isNewSession ? "back anew" : "back");
                                    });
    }

    BundleOnDisk bundle;
    TROUBLE& trouble = *static_cast<TROUBLE*>(
        dlsym(dlopen(COMGUI_TROUBLED_PLUGIN, RTLD_NOW | RTLD_LOCAL), "TroubledPlugInOrders"));
    comgui::TaskQueue queue;
    std::vector<std::string> heard;
};
