#include "LocalizerImpl/PieceTable.h"

#include <algorithm>
#include <new>

static_assert(sizeof(tag_PieceRow) == 64, "a row fills one cache line");

namespace
{

constexpr uint16_t ALL_OFFSETS = 0xFFFF;

tag_PieceRow EmptyRow(wchar_t code)
{
    tag_PieceRow row = {};
    row.code = code;
    row.uFirstFound = CPieceTable::NOT_FOUND;
    return row;
}

} // namespace

CPieceTable::CPieceTable(CQVLocalizerManager& matcher, PYOFWORDS* pMap, const wchar_t* szInput,
                         int iInputLen)
    : m_matcher(matcher), m_pMap(pMap), m_szInput(szInput), m_iInputLen(iInputLen), m_uValidLast(0),
      m_pRowOfKey(new (std::nothrow) uint16_t[KEY_COUNT]()),
      m_pFirstEnds(new (std::nothrow) uint16_t[KEY_COUNT]), m_noRow(EmptyRow(0))
{
    if (m_pFirstEnds != nullptr)
    {
        std::fill_n(m_pFirstEnds.get(), KEY_COUNT, NOT_ASKED);
    }
    m_noRow.uFilled = ALL_OFFSETS;
    for (int iOffset = 0; iOffset < iInputLen; ++iOffset)
    {
        if (IsLastPieceValid(iOffset))
        {
            m_uValidLast = static_cast<uint16_t>(m_uValidLast | (1U << iOffset));
        }
    }
}

wchar_t* CPieceTable::Piece(int iOffset, int iEnd)
{
    CQVLocalizerManager::SubString(m_szInput, m_iInputLen, m_szPiece, iOffset, iEnd);
    m_szPiece[iEnd - iOffset] = 0;
    return m_szPiece;
}

bool CPieceTable::IsLastPieceValid(int iOffset)
{
    android::Vector<wchar_t*> vPieces;
    vPieces.push(Piece(iOffset, m_iInputLen));
    return m_matcher.IsValid(vPieces) != 0;
}

int CPieceTable::KeyOfOther(uint16_t uCode)
{
    if (IsAlphaCode(uCode))
    {
        return KEY_ALPHA + (uCode - LOC_ALPHA_BASE);
    }
    if (IsDigitCode(uCode))
    {
        return KEY_DIGIT + (uCode - LOC_DIGIT_BASE);
    }
    return uCode == LOC_OTHER ? KEY_OTHER : KEY_UNKNOWN;
}

// Only a damaged record holds such a code. It acts by its low 16 bits, but a typed character is
// not equal to it, and it is not LOC_OTHER for the mask.
int CPieceTable::KeyOfWide(wchar_t code) const
{
    const uint16_t uCode = CodeBits(code);
    if (uCode == LOC_OTHER)
    {
        return KEY_WIDE_OTHER;
    }
    if (IsHanZiCode(uCode))
    {
        const wchar_t* pEnd = m_szInput + m_iInputLen;
        const wchar_t* pTyped = std::find(m_szInput, pEnd, static_cast<wchar_t>(uCode));
        if (pTyped != pEnd)
        {
            return KEY_WIDE_TYPED + static_cast<int>(pTyped - m_szInput);
        }
    }
    return KeyOfBits(uCode);
}

tag_PieceRow& CPieceTable::AddRow(wchar_t code, int iKey)
{
    std::unique_ptr<tag_PieceRow[]>& chunk = m_apChunks[m_iRows / CHUNK_ROWS];
    if (chunk == nullptr)
    {
        chunk.reset(new (std::nothrow) tag_PieceRow[CHUNK_ROWS]);
    }
    if (chunk == nullptr || m_pRowOfKey == nullptr)
    {
        return m_noRow;
    }
    const bool bWhole = iKey == KEY_WIDE_OTHER || iKey >= KEY_WIDE_TYPED;
    tag_PieceRow& row = chunk[static_cast<size_t>(m_iRows % CHUNK_ROWS)];
    row = EmptyRow(bWhole ? code : static_cast<wchar_t>(CodeBits(code)));
    m_pRowOfKey[static_cast<size_t>(iKey)] = static_cast<uint16_t>(++m_iRows);
    return row;
}

uint16_t CPieceTable::AskFirstEnds(wchar_t code, int iKey)
{
    const uint16_t uEnds = Ends(RowOf(code), 0);
    if (m_pFirstEnds != nullptr)
    {
        m_pFirstEnds[static_cast<size_t>(iKey)] = uEnds;
    }
    return uEnds;
}

void CPieceTable::Fill(tag_PieceRow& row, int iOffset)
{
    unsigned uEnds = 0;
    unsigned uFull = 0;
    for (int iEnd = iOffset + 1; iEnd <= m_iInputLen; ++iEnd)
    {
        bool bFull = false;
        if (!Fits(row, Piece(iOffset, iEnd), bFull))
        {
            break; // no longer piece fits either
        }
        const bool bTried = iEnd < m_iInputLen || ((m_uValidLast >> iOffset) & 1U) != 0;
        uEnds |= static_cast<unsigned>(bTried) << iEnd;
        uFull |= static_cast<unsigned>(bTried && bFull) << iEnd;
    }
    row.auEnds[iOffset] = static_cast<uint16_t>(uEnds);
    row.auFull[iOffset] = static_cast<uint16_t>(uFull);
    row.uFilled = static_cast<uint16_t>(row.uFilled | (1U << iOffset));
}

bool CPieceTable::Fits(const tag_PieceRow& row, wchar_t* szPiece, bool& bFull)
{
    const uint16_t uCode = CodeBits(row.code);
    bFull = true; // only Chinese characters can take less than all of themselves
    if (IsAlphaCode(uCode))
    {
        return m_matcher.CmpEnglishWords(uCode, szPiece) != 0;
    }
    if (IsHanZiCode(uCode))
    {
        _mask_type unused = {};
        int iFull = 0;
        const int iFits = m_matcher.CmpChineseWord(m_pMap, row.code, m_pMap[HanZiRecord(row.code)],
                                                   szPiece, &unused, 0, iFull);
        bFull = iFull != 0;
        return iFits != 0;
    }
    if (IsDigitCode(uCode))
    {
        return m_matcher.CmpDigitalWord(uCode, szPiece) != 0;
    }
    return m_matcher.CmpOtherWords(uCode, szPiece) != 0;
}
