#ifndef QV_TESTS_LOCALIZERIMPL_SEARCHMODEL_H
#define QV_TESTS_LOCALIZERIMPL_SEARCHMODEL_H

#include "Core/LocalizerCodes.h"
#include "Core/SearchRecords.h"

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

// What a search answers.
struct tag_Answer
{
    std::vector<tag_LocalizerDetail> vEntries;
    uint32_t uMask = 0;
    std::wstring strWords;
};

// The search as one would explain it: every split of the text against every name, from its first
// character on, one after the other. Shares nothing with the library but the records.
class CSearchModel
{
public:
    CSearchModel(const PYOFWORDS* pTable, bool bDigits, bool bAnywhere)
        : m_pTable(pTable), m_bDigits(bDigits), m_bAnywhere(bAnywhere)
    {
    }

    // strInput is lowercase with Chinese characters as codes, 1 to 10 characters.
    tag_Answer Search(const std::vector<tag_LocalizerDetail>& vCandidates,
                      const std::wstring& strInput);

private:
    struct tag_Found
    {
        size_t uCandidate;
        int iType;
        int iStart;
        int iPieces;
        int32_t iSortIndex;
    };
    using Pieces = std::vector<std::wstring>; // first piece first

    static std::vector<Pieces> Splits(const std::wstring& strInput);
    bool IsValid(const std::wstring& strLast) const;
    bool Fits(wchar_t code, const std::wstring& strPiece, bool& bFull) const;
    bool FitsChinese(wchar_t code, const std::wstring& strPiece, bool& bFull) const;
    void Try(const Pieces& vPieces, const tag_LocalizerDetail& name, size_t uCandidate);
    void Succeed(const Pieces& vPieces, const std::wstring& strCodes, size_t uStart, bool bAllFull,
                 const tag_LocalizerDetail& name, size_t uCandidate);
    void OfferLastPiece(wchar_t code, const std::wstring& strPiece);
    void OfferNext(wchar_t code);
    static bool ComesBefore(const tag_Found& a, const tag_Found& b);
    const char* Spelling(wchar_t code, int iReading, bool bKeys) const;

    const PYOFWORDS* m_pTable;
    bool m_bDigits;
    bool m_bAnywhere;
    size_t m_uInputLen = 0;
    std::vector<tag_Found> m_vFound;
    uint32_t m_uMask = 0;
    std::wstring m_strWords;
};

// A candidate entry from its codes.
tag_LocalizerDetail MakeDetail(int iId, int iSortIndex, const std::wstring& strCodes);

#endif
