#ifndef QV_CORE_RECORDS_CANDIDATEFILTER_H
#define QV_CORE_RECORDS_CANDIDATEFILTER_H

// What a search tells the store manager before it reads the store, so that contacts it cannot
// find need no entry.
class CCandidateFilter
{
public:
    virtual ~CCandidateFilter() = default;

    // False when no contact with these CONTACT_MAX_KEY codes, of which those from the first 0 on do
    // not count, can be in the search's result.
    virtual bool MayMatch(const wchar_t* pCodes) = 0;
};

#endif
