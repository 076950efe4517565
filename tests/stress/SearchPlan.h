#ifndef QV_TESTS_STRESS_SEARCHPLAN_H
#define QV_TESTS_STRESS_SEARCHPLAN_H

#include "Core/SearchRecords.h"

#include <cstdint>
#include <random>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

class CLocalizerLogic;

// A search of the store and the narrowing searches that follow it while somebody types.
struct tag_SearchPlan
{
    std::vector<std::pair<int, QVLong32>> vFilters{}; // kind and id
    IME_SEARCH_TYPE eType = IME_SEARCH_WORD;
    std::vector<std::wstring> vTexts{}; // each typed on from the one before
};
tag_SearchPlan AnyPlan(std::mt19937& random);

// What a plan's searches reported.
struct tag_SearchOutcome
{
    uint64_t uHash = 0;  // every byte of every result but the index characters
    uint64_t uIndex = 0; // the index characters, which depend on the sort type
    int iFound = 0;      // contacts of the first search
};
// A result that holds a contact twice.
class CFoundTwice : public std::runtime_error
{
public:
    using std::runtime_error::runtime_error;
};
// CFoundTwice, or std::runtime_error when a search fails.
tag_SearchOutcome RunPlan(CLocalizerLogic& logic, const tag_SearchPlan& plan);

#endif
