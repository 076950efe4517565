#include "LocalizerImpl/PieceTable.h"

#include <algorithm>
#include <new>

namespace
{

bool IsChineseUnit(wchar_t unit)
{
    return IsHanZiCode(CodeBits(unit));
}

} // namespace

CPieceTable::CPieceTable(CQVLocalizerManager& matcher, const CReadingSets& sets,
                         const wchar_t* szInput, int iInputLen)
    : m_matcher(matcher), m_sets(sets), m_szInput(szInput), m_iInputLen(iInputLen),
      m_pKeys(sets.Keys()), m_pRows(new (std::nothrow) tag_Row[static_cast<size_t>(KeyCount())]())
{
    m_bReady = m_pRows != nullptr && AskLastPieces() && AddTypedKeys();
}

// Finds out which offsets have a last piece that is worth trying. False if the allocation fails.
bool CPieceTable::AskLastPieces()
{
    for (int iOffset = 0; iOffset < m_iInputLen; ++iOffset)
    {
        m_aszUnits[iOffset][0] = m_szInput[iOffset];
        android::Vector<wchar_t*> vPieces;
        if (vPieces.add(Piece(iOffset, m_iInputLen)) < 0)
        {
            return false;
        }
        const int bValid = m_matcher.IsValid(vPieces) != 0 ? 1 : 0;
        m_uValidLast = static_cast<uint16_t>(m_uValidLast | (bValid << iOffset));
    }
    return true;
}

// A typed Chinese character fits its own code alone, all 32 bits of it, and no other code of the
// set. False if the allocation fails.
bool CPieceTable::AddTypedKeys()
{
    if (std::none_of(m_szInput, m_szInput + m_iInputLen, IsChineseUnit))
    {
        return true;
    }
    m_pOwnKeys.reset(new (std::nothrow) uint16_t[CReadingSets::CODE_COUNT]);
    if (m_pOwnKeys == nullptr)
    {
        return false;
    }
    std::copy_n(m_sets.Keys(), CReadingSets::CODE_COUNT, m_pOwnKeys.get());
    m_pKeys = m_pOwnKeys.get();
    for (int i = 0; i < m_iInputLen; ++i)
    {
        const wchar_t unit = m_szInput[i];
        if (IsHanZiCode(CodeBits(unit)) && static_cast<wchar_t>(CodeBits(unit)) == unit)
        {
            m_pOwnKeys[CodeBits(unit)] = static_cast<uint16_t>(m_sets.KeyCount() + i);
        }
    }
    return true;
}

wchar_t* CPieceTable::Piece(int iOffset, int iEnd)
{
    if (iEnd == iOffset + 1)
    {
        return m_aszUnits[iOffset];
    }
    CQVLocalizerManager::SubString(m_szInput, m_iInputLen, m_szPiece, iOffset, iEnd);
    m_szPiece[iEnd - iOffset] = 0;
    return m_szPiece;
}

int CPieceTable::KeyOfWide(wchar_t code) const
{
    const wchar_t* pEnd = m_szInput + m_iInputLen;
    const wchar_t* pTyped = IsChineseUnit(code) ? std::find(m_szInput, pEnd, code) : pEnd;
    return pTyped != pEnd ? m_sets.KeyCount() + static_cast<int>(pTyped - m_szInput)
                          : m_sets.KeyOf(code);
}

tag_KeyMeaning CPieceTable::MeaningOf(int iKey) const
{
    const bool bTyped = iKey >= m_sets.KeyCount();
    return m_sets.MeaningOf(bTyped ? m_sets.KeyOf(TypedUnit(iKey)) : iKey);
}

wchar_t CPieceTable::TypedUnit(int iKey) const
{
    const int iUnit = iKey - m_sets.KeyCount();
    return iUnit < 0 ? LOC_NO_CODE : m_szInput[iUnit];
}

unsigned CPieceTable::AskEnds(int iKey, int iOffset)
{
    tag_Row& row = m_pRows[static_cast<size_t>(iKey)];
    unsigned uEnds = 0;
    unsigned uFull = 0;
    for (int iEnd = iOffset + 1; iEnd <= m_iInputLen; ++iEnd)
    {
        bool bFull = false;
        if (!Fits(iKey, Piece(iOffset, iEnd), bFull))
        {
            break; // no longer piece fits either
        }
        const bool bTried = iEnd < m_iInputLen || ((unsigned{m_uValidLast} >> iOffset) & 1U) != 0;
        uEnds |= static_cast<unsigned>(bTried) << iEnd;
        uFull |= static_cast<unsigned>(bTried && bFull) << iEnd;
    }
    row.auEnds[iOffset] = static_cast<uint16_t>(uEnds | ASKED);
    row.auFull[iOffset] = static_cast<uint16_t>(uFull);
    row.uDead = static_cast<uint16_t>(row.uDead | (unsigned{uEnds == 0} << iOffset));
    return uEnds;
}

bool CPieceTable::Fits(int iKey, wchar_t* szPiece, bool& bFull)
{
    const tag_KeyMeaning meaning = MeaningOf(iKey);
    if (meaning.pRecord != nullptr)
    {
        _mask_type unused = {};
        int iFull = 0;
        const int iFits = m_matcher.CmpChineseWord(m_sets.Records(), TypedUnit(iKey),
                                                   *meaning.pRecord, szPiece, &unused, 0, iFull);
        bFull = iFull != 0;
        return iFits != 0;
    }
    const uint16_t uCode = CodeBits(meaning.code);
    bFull = true; // only Chinese characters can take less than all of themselves
    if (IsAlphaCode(uCode))
    {
        return m_matcher.CmpEnglishWords(uCode, szPiece) != 0;
    }
    return (IsDigitCode(uCode) ? m_matcher.CmpDigitalWord(uCode, szPiece)
                               : m_matcher.CmpOtherWords(uCode, szPiece)) != 0;
}
