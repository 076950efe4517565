#ifndef QV_CORE_RECORDS_CANDIDATEFILTER_H
#define QV_CORE_RECORDS_CANDIDATEFILTER_H

// A search's test of one contact. The store manager applies it while it reads the store, so that
// contacts which cannot match get no entry.
class CCandidateFilter
{
public:
    virtual ~CCandidateFilter() = default;

    // False when no contact with these codes can be in the search's result. pCodes has
    // CONTACT_MAX_KEY codes, of which those from the first 0 on do not count.
    virtual bool MayMatch(const wchar_t* pCodes) = 0;
};

#endif
