#ifndef QV_TESTS_STRESS_SEARCHPLAN_H
#define QV_TESTS_STRESS_SEARCHPLAN_H

#include "Core/SearchRecords.h"

#include <cstdint>
#include <random>
#include <string>
#include <vector>

class CLocalizerLogic;

// A search of the store and the narrowing searches that follow it while somebody types.
struct tag_SearchPlan
{
    static constexpr size_t MAX_FILTERS = 3;

    int iFilters = 0;
    int aiKinds[MAX_FILTERS] = {};
    QVLong32 alIds[MAX_FILTERS] = {};
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
    int iTwice = 0;      // entries of contacts that a result holds already
};
// std::runtime_error when a search fails.
tag_SearchOutcome RunPlan(CLocalizerLogic& logic, tag_SearchPlan plan);

#endif
