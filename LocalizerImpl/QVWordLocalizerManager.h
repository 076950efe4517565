#ifndef QV_LOCALIZERIMPL_QVWORDLOCALIZERMANAGER_H
#define QV_LOCALIZERIMPL_QVWORDLOCALIZERMANAGER_H

#include "LocalizerImpl/QVLocalizerManager.h"

// Matches typed letters: a Chinese character by the letters that begin one of its readings or by
// itself typed directly, a letter and a digit by itself; "#" stands for any digit or other
// character.
class QV_EXPORT CQVWordLocalizerManager : public CQVLocalizerManager
{
public:
    // bMatchAnywhere 0: a match begins only at a name's first character.
    explicit CQVWordLocalizerManager(int bMatchAnywhere);

    // A piece of one character that is neither a letter nor the character itself fits no reading.
    // With bLastPiece, every reading that the piece begins adds its next letter to the mask of
    // this object (pMask is not used), and the character becomes a candidate for as many typed
    // letters as the piece has.
    int CmpChineseWord(PYOFWORDS* pMap, wchar_t code, PYOFWORDS& record, wchar_t* szPiece,
                       _mask_type* pMask, int bLastPiece, int& bFull) override;
    int CmpEnglishWords(unsigned short code, wchar_t* szPiece) override;
    int CmpOtherWords(unsigned short code, wchar_t* szPiece) override;
    int CmpDigitalWord(unsigned short code, wchar_t* szPiece) override;
    // A last piece of 2 to 6 characters must begin a syllable.
    int IsValid(android::Vector<wchar_t*>& vPieces) override;

private:
    QV_INTERNAL void OfferReading(PYOFWORDS* pMap, const PYOFWORDS& record, const char* szReading,
                                  int iLength, int iTyped);
};

#endif
