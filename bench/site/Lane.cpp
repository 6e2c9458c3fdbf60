#include "bench/site/Lane.h"

#include <algorithm>
#include <iostream>
#include <iterator>

void Wrongs::Take(std::string const& where, std::string const& kind, std::string const& what)
{
    constexpr int MostPrinted = 20;  // of a kind: one fault may show itself everywhere
    if (++m_counts[m_counts.contains(kind) ? kind : "lost"] > MostPrinted)
        return;
    std::cerr << where << ": " << what << std::endl;
}

int Wrongs::Count(std::string const& kind) const
{
    auto const count = m_counts.find(kind);
    return count == m_counts.end() ? 0 : count->second;
}

bool Wrongs::IsGood() const
{
    return std::all_of(m_counts.begin(), m_counts.end(), [](auto const& count) { return count.second == 0; });
}

std::string Wrongs::Text() const
{
    std::string text;
    for (auto const& [kind, count] : m_counts)
        text += (text.empty() ? "" : ", ") + std::to_string(count) + " " + kind;
    return text;
}

void LaneStock::Delete(int number)
{
    std::erase(m_there, number);
    m_deleted.insert(number);
}

// One more may be there, or where a deletion was due the oldest may be gone. What is gone never comes back:
// the newest always stays, so no number is given anew.
void LaneStock::Compare(std::vector<int> const& found, std::string const& where, Wrongs& wrongs)
{
    std::vector<int> expected = m_there;
    auto const isThere = [&](int number)
    { return std::find(found.begin(), found.end(), number) != found.end(); };
    if (expected.size() == m_most && !isThere(expected.front()))
    {
        m_deleted.insert(expected.front());
        expected.erase(expected.begin());
    }
    std::string const what = std::string(m_what) + " ";
    for (int const number : expected)
        if (!isThere(number))
            wrongs.Take(where, "lost", what + std::to_string(number) + " was created, but is gone");
    std::size_t const most = m_there.size() < m_most ? expected.size() + 1 : expected.size();
    if (found.size() > most)
        wrongs.Take(where, "lost", "more of " + what + "are there than were created");
    for (int const number : found)
        if (m_deleted.contains(number))
            wrongs.Take(where, "lost", what + std::to_string(number) + " was deleted, but is there");
    m_there = found;
}

void Lane::Take(std::string const& line)
{
    std::istringstream words(line);
    std::string kind;
    words >> kind;
    if (kind == "found")
        return Compare(words);
    std::int64_t number = 0;
    bool const hasNumber = !(words >> number).fail();
    if (kind == "counter" && hasNumber)
        m_now.counter = number;
    else if (kind == "table" && hasNumber)
        m_now.table = number;
    else if (kind == "append" && hasNumber && words >> m_block)
        m_now.appended = number;
    else if (kind == "create" && hasNumber)
        m_tickets.Create(static_cast<int>(number));
    else if (kind == "delete" && hasNumber)
        m_tickets.Delete(static_cast<int>(number));
    else if (kind == "send" && hasNumber)
        m_jobs.Create(static_cast<int>(number));
    else if (kind == "drop" && hasNumber)
        m_jobs.Delete(static_cast<int>(number));
    else
        return m_wrongs.Take(m_where, kind, line);
    ++m_changes;
}

void Lane::Compare(std::istringstream& found)
{
    CompareNumber("counter", m_now.counter, found);
    CompareNumber("table", m_now.table, found);
    CompareNumber("appended", m_now.appended, found);
    std::vector<int> const tickets(std::istream_iterator<int>(found), {});
    found.clear();
    std::string word;
    if (!(found >> word) || word != "jobs")
        m_wrongs.Take(m_where, "lost", "what the program finds is no such line");
    m_tickets.Compare(tickets, m_where, m_wrongs);
    m_jobs.Compare({std::istream_iterator<int>(found), {}}, m_where, m_wrongs);
    ++m_finds;
}

// One more may have been done whose report is missing.
void Lane::CompareNumber(char const* what, std::int64_t& acknowledged, std::istringstream& found)
{
    std::int64_t number = -1;
    found >> number;
    if (number != acknowledged && number != acknowledged + 1)
        m_wrongs.Take(m_where, "lost",
                      std::string(what) + " " + std::to_string(acknowledged) + " was acknowledged, " +
                          std::to_string(number) + " is there");
    acknowledged = number;
}

void Lane::CompareCopy(std::string const& line, Past const& past) const
{
    std::istringstream found(line.substr(line.find(' ') + 1));
    Past copy{-1, -1, -1};
    found >> copy.counter >> copy.table >> copy.appended;
    if (copy.counter < past.counter || copy.table < past.table || copy.appended < past.appended)
        m_wrongs.Take(m_where, "lost",
                      "a copy of the site has less than what was acknowledged when it began: " + line);
}
