// What a check has at hand: what the user has said, the loaded plug-in, and expectations that end the check
// when they are not met.
#pragma once

#include "comgui/session/ComGUIModuleInterface.h"
#include "tools/comgui_validate/Check.h"
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>

namespace validate
{
// The last call of a check, where the process that started it can read it, however the check ends.
class LastCall
{
public:
    LastCall();
    ~LastCall();
    LastCall(LastCall const&) = delete;
    LastCall& operator=(LastCall const&) = delete;

    void Set(std::string const& call);  // of any length; long ones are cut
    std::string Get() const;

private:
    static constexpr std::size_t Size = 4096;
    char* m_text;  // in memory that the two processes share
};

// The plug-in after all steps of its loading.
struct Module
{
    ComGUIModuleInterface** pointer = nullptr;  // what QueryInterface has given
    ComGUIModuleInterface table{};              // the host's copy
    void* instance = nullptr;

    ComGUIModuleInterface const& Live() const { return **pointer; }
};

class Trial
{
public:
    Trial(Options const& options, LastCall& lastCall) : m_options(options), m_lastCall(lastCall) {}

    Options const& GetOptions() const { return m_options; }
    std::string Option(char const* name, char const* otherwise) const;
    bool HasOption(char const* name) const { return m_options.more.count(name) != 0; }

    // Loaded at the first use. Skipped, if that fails: other checks look into why.
    Module& GetModule();

    // What is called next. From any thread.
    void Calling(std::string call);

    // Throws Broken unless it holds, about the last call. From any thread.
    void Expect(char const* rule, bool holds, std::string const& came, std::string const& due) const;
    void ExpectZero(char const* rule, int result) const;
    void ExpectFailure(char const* rule, int code) const;    // of an entry: any but 0
    void ExpectSuccess(char const* rule, int result) const;  // of a slot: any but 0
    void ExpectRefusal(char const* rule, int result) const;  // of a slot: 0

private:
    Options const& m_options;
    LastCall& m_lastCall;
    mutable std::mutex m_lock;
    std::string m_call;
    std::unique_ptr<Module> m_module;
};

// None if it is not one, or not alone.
std::optional<int> NumberOf(std::string_view text);

// In quotes, with nothing that a terminal might obey.
std::string Quoted(std::string const& text);
}  // namespace validate
