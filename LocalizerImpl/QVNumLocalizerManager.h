#ifndef QV_LOCALIZERIMPL_QVNUMLOCALIZERMANAGER_H
#define QV_LOCALIZERIMPL_QVNUMLOCALIZERMANAGER_H

#include "LocalizerImpl/QVLocalizerManager.h"

// Matches keypad digits: a Chinese character by the keys of the beginning of one of its readings,
// a letter by its key, a digit by itself; other characters by nothing. It adds nothing to the
// mask and the candidate characters.
class QV_EXPORT CQVNumLocalizerManager : public CQVLocalizerManager
{
public:
    // bMatchAnywhere 0: a match begins only at a name's first character.
    explicit CQVNumLocalizerManager(int bMatchAnywhere);

    int CmpChineseWord(PYOFWORDS* pMap, wchar_t code, PYOFWORDS& record, wchar_t* szPiece,
                       _mask_type* pMask, int bLastPiece, int& bFull) override;
    int CmpEnglishWords(unsigned short code, wchar_t* szPiece) override;
    int CmpOtherWords(unsigned short code, wchar_t* szPiece) override;
    // Writes a debug line with its result for every piece of one character.
    int CmpDigitalWord(unsigned short code, wchar_t* szPiece) override;
    // A last piece of 2 to 6 characters must be keys with letters.
    int IsValid(android::Vector<wchar_t*>& vPieces) override;

    // The key that carries a lowercase letter; any other value is returned as it is.
    wchar_t GetPYNum(wchar_t unit);
    // 1 for a key that carries letters, '2'..'9'.
    int IsNumber(wchar_t unit);
};

#endif
