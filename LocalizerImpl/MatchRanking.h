#ifndef QV_LOCALIZERIMPL_MATCHRANKING_H
#define QV_LOCALIZERIMPL_MATCHRANKING_H

#include "Core/Records/SearchRecords.h"

#include <cstdint>
#include <utils/Vector.h>

// Brings the matches of one search, which stand in the order of their candidates, into ranking
// order, in time proportional to their number unless some are equal in every key.
// Matches equal in every key keep the order that LocalResultQuickSort leaves when it starts from
// the order in which they were first found; pFirstSplits, one per match, is the split that first
// found each. 0, or -1 with the vector unsorted if the allocation fails.
int RankMatches(android::Vector<_MatchResult>& vMatches, const uint16_t* pFirstSplits,
                tag_LocalizerDetail* pDetail);

// Negative when a comes before b in the ranking, positive when behind; pDetail are the candidates.
int CompareMatches(const _MatchResult& a, const _MatchResult& b,
                   const tag_LocalizerDetail* pDetail);

#endif
