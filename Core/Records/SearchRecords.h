#ifndef QV_CORE_RECORDS_SEARCHRECORDS_H
#define QV_CORE_RECORDS_SEARCHRECORDS_H

// The records that a search exchanges with its caller and with the ranking.

#include "Core/Records/ContactRecords.h"

// What the typed text is and where it is searched.
enum IME_SEARCH_TYPE : int
{
    IME_SEARCH_WORD = 0,   // letters, over the contacts
    IME_SEARCH_NUM = 1,    // keypad digits, over the contacts
    IME_SEARCH_SPECIAL = 2 // letters, over the fixed special numbers
};

// One contact as a search sees it. Callers read these bytes directly.
struct tag_LocalizerDetail
{
    int32_t iContactID;                          // the provider's _id
    int32_t iSortIndex;                          // place in name order, the last ranking key
    wchar_t szLocalizerKey[CONTACT_MAX_KEY + 1]; // what is matched; zero-terminated
    wchar_t szReserved[5];                       // copied from the record, never read
    int32_t iMatchPos;  // first matched character << 16 | last one; 0 for an empty input
    int32_t iFirstWord; // index character for an empty input ('A'..'Z', '#', '1'..'5'), else 0
    int64_t llLastTimeContacted; // milliseconds since 1970, UTC
};
static_assert(sizeof(tag_LocalizerDetail) == 88, "part of the interface");
static_assert(offsetof(tag_LocalizerDetail, szLocalizerKey) == 8, "part of the interface");
static_assert(offsetof(tag_LocalizerDetail, szReserved) == 52, "part of the interface");
static_assert(offsetof(tag_LocalizerDetail, iMatchPos) == 72, "part of the interface");
static_assert(offsetof(tag_LocalizerDetail, iFirstWord) == 76, "part of the interface");
static_assert(offsetof(tag_LocalizerDetail, llLastTimeContacted) == 80, "part of the interface");
static_assert(std::is_trivially_copyable<tag_LocalizerDetail>::value, "copied whole");

// A result set. pDetail is null when iResultNum is 0 and no array was made.
struct tag_LocalizerResult
{
    int32_t iResultNum;           // entries
    tag_LocalizerDetail* pDetail; // the entries, best first
};
static_assert(sizeof(void*) != 4 || sizeof(tag_LocalizerResult) == 8, "part of the interface");

// How well the typed text fits a name; the larger value ranks first.
constexpr int32_t MATCH_LIST = 0;     // empty input, every candidate is listed
constexpr int32_t MATCH_PARTIAL = 1;  // some character took only the beginning of a reading
constexpr int32_t MATCH_FULL = 2;     // every Chinese character took a whole reading
constexpr int32_t MATCH_INITIALS = 3; // one typed character per name character

// iMatchPos from the places of the first and the last matched character, and back.
constexpr int MATCH_POS_BITS = 16;
constexpr int32_t MatchPosition(int iFirst, int iLast)
{
    return (iFirst << MATCH_POS_BITS) | iLast;
}
constexpr int MatchFirst(int32_t iMatchPos)
{
    return static_cast<int>(static_cast<uint32_t>(iMatchPos) >> MATCH_POS_BITS);
}
constexpr int MatchLast(int32_t iMatchPos)
{
    return static_cast<uint16_t>(iMatchPos);
}

// One match of a running search.
struct _MatchResult
{
    int32_t iIndex;     // place of the contact in the candidate set
    int32_t iMatchType; // MATCH_*
    int32_t iMatchPos;  // as in tag_LocalizerDetail
    int32_t iFirstWord; // as in tag_LocalizerDetail
};
static_assert(sizeof(_MatchResult) == 16, "four 32-bit fields");

#endif
