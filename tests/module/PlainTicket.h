// A ticket as a model has it: a map of keys to maps of positions, and nothing else.
#pragma once

#include "tests/module/ModelStep.h"
#include <functional>
#include <map>

struct PLAIN_VALUE
{
    PARAM_TYPE type = PARAM_NONE;
    std::string text = "none";  // as TextOf gives it
};

// What one write made different; position -1 for a key that began anew or is gone.
struct PLAIN_CHANGE
{
    std::string key;
    int pos = -1;
    PLAIN_VALUE value{};
};

class PLAIN_TICKET
{
public:
    // What a read gives, as a text; nothing if it fails.
    std::optional<std::string> Read(MODEL_RECORD const& record) const;

    // False for what is refused. changes gets what has become different.
    bool Write(MODEL_RECORD const& record, std::vector<PLAIN_CHANGE>& changes);
    void Make(PLAIN_CHANGE const& change);

    // A value that a walk comes to, the first at or behind a position of a key; nothing if there is none.
    std::optional<std::pair<int, std::string>> From(std::string const& key, int pos) const;
    std::vector<std::string> KeysWith(std::string const& prefix) const;

    // Every value of the keys that are chosen, in the order of a walk, a line each.
    std::vector<std::string> Lines(std::function<bool(std::string const& key)> const& isChosen) const;

    void DropPointers();

private:
    int Count(std::string const& key) const;

    std::map<std::string, std::map<int, PLAIN_VALUE>> m_keys;  // no key is without a value
};

// A line of a walk.
std::string WalkedLine(std::string const& key, int pos, std::string const& value);
