#ifndef QV_DBOPERATOR_SQLIDLIST_H
#define QV_DBOPERATOR_SQLIDLIST_H

#include <cstddef>

// The ids that a query is limited to, as the text " in(1,2,3)".
class CSqlIdList
{
public:
    static constexpr long MAX_IDS = 200;
    // No further id is appended to a text of this many characters or more.
    static constexpr size_t TEXT_LIMIT = 1798;
    // Size of the text with its terminator: the last id may begin just below the limit.
    static constexpr size_t TEXT_SIZE = TEXT_LIMIT - 1 + sizeof(",-2147483648)");

    // The list of the lCount ids of pIds, each in the decimal form of its low 32 bits, without the
    // ids that do not fit; empty (no restriction) unless lCount is 1 to MAX_IDS.
    CSqlIdList(long lCount, const long long* pIds);

    // Whether a read with this count is restricted to a list.
    static bool IsListed(long lCount) { return lCount >= 1 && lCount <= MAX_IDS; }
    // Whether a read limited to these ids would see all of them: neither too many nor too long.
    // False for a null pIds.
    static bool CanListAll(long lCount, const long long* pIds);

    bool IsEmpty() const { return m_szText[0] == '\0'; }
    const char* Text() const { return m_szText; }

private:
    void Append(const char* szBefore, long long llId);

    char m_szText[TEXT_SIZE];
    size_t m_iLength;
    long m_lWritten; // ids in the text
};

#endif
