// What the parent of several CrashWriters knows of their lanes from their reports, and what is wrong there.
#pragma once

#include "bench/site/CrashWriter.h"
#include <cstdint>
#include <map>
#include <set>
#include <sstream>
#include <string>
#include <vector>

// Counts what is wrong, and prints the first cases of each kind when they are found.
class Wrongs
{
public:
    // where: who found it, such as "lane 3". kind: its first word, if that is torn, misheard, refused or one
    // of the others that were announced; everything else is lost.
    void Take(std::string const& where, std::string const& kind, std::string const& what);
    void Announce(std::string const& kind) { m_counts[kind]; }  // shown even if it stays 0

    int Count(std::string const& kind) const;
    bool IsGood() const;
    std::string Text() const;  // "0 lost, 0 torn, ..."

private:
    std::map<std::string, int> m_counts{{"lost", 0}, {"misheard", 0}, {"refused", 0}, {"torn", 0}};
};

// Things of a lane that are created one after another, each with a number greater than the one before, of
// which only the oldest is deleted, and only when there are as many as may be.
class LaneStock
{
public:
    LaneStock(char const* what, std::size_t most) : m_what(what), m_most(most) {}

    void Create(int number) { m_there.push_back(number); }
    void Delete(int number);

    // Compares with what is there, and goes on from that. Of the last change the report may be missing.
    void Compare(std::vector<int> const& found, std::string const& where, Wrongs& wrongs);

    std::vector<int> const& There() const { return m_there; }

private:
    char const* m_what;
    std::size_t m_most;
    std::vector<int> m_there;
    std::set<int> m_deleted;
};

// What is known of a lane, from the reports of its writers.
class Lane
{
public:
    Lane(int number, Wrongs& wrongs) : m_where("lane " + std::to_string(number)), m_wrongs(wrongs) {}

    // Takes a line of a writer.
    void Take(std::string const& line);

    // Checks that a "found" line has at least what has been acknowledged when that copy of the lane was made.
    struct Past
    {
        std::int64_t counter = 0;
        std::int64_t table = 0;
        std::int64_t appended = 0;
    };
    Past const& Now() const { return m_now; }
    void CompareCopy(std::string const& line, Past const& past) const;

    int Block() const { return m_block; }  // of the list, where the lane's last number is
    std::size_t Jobs() const { return m_jobs.There().size(); }
    std::int64_t Changes() const { return m_changes; }
    std::int64_t Finds() const { return m_finds; }

private:
    void Compare(std::istringstream& found);
    void CompareNumber(char const* what, std::int64_t& acknowledged, std::istringstream& found);

    std::string m_where;
    Wrongs& m_wrongs;
    Past m_now;
    int m_block = 1;
    LaneStock m_tickets{"ticket", MostTickets};
    LaneStock m_jobs{"job", MostJobs};
    std::int64_t m_changes = 0;
    std::int64_t m_finds = 0;
};
