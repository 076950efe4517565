#ifndef QV_LOCALIZERIMPL_QVLOCALIZERMANAGER_H
#define QV_LOCALIZERIMPL_QVLOCALIZERMANAGER_H

#include "Common/Export.h"
#include "Core/Records/ContactRecords.h"
#include "Core/Records/LocalizerCodes.h"
#include "Core/Records/SearchRecords.h"

#include <cstdint>
#include <utils/Vector.h>

class Common_Qsort;

constexpr int LOC_MAX_INPUT = 10;    // characters of a typed text
constexpr int LOC_PIECE_BUFFER = 20; // wide characters of a piece's buffer
constexpr int CN_WORD_MAX = 20;      // candidate characters that one search reports
constexpr int LOC_NAME_BUFFER = CONTACT_MAX_NAME + 1; // wide characters of a name
constexpr int LOC_SPELLING_BUFFER = 240; // wide characters of a pinyin key while it is made

// Bit of the key mask for digits and other characters; bits 0..25 are the letters.
constexpr uint32_t MASK_OTHER = 0x4000000;

// The keys that can usefully be typed next.
struct _mask_type
{
    uint32_t lMask;     // bits 0..25: letters; MASK_OTHER
    uint32_t lReserved; // cleared with lMask, never set
};
static_assert(sizeof(_mask_type) == 8, "two 32-bit words");

// A Chinese character that the last typed letters may stand for.
struct CNWORDOUTPUT
{
    wchar_t wszWord[4]; // one character and its terminator; empty ends the list
    uint16_t nMatchLen; // typed letters that it would replace
};

// Pinyin table, name conversion, search and ranking. The static members need no object; an
// object is one search, made by a matcher class (CQVWordLocalizerManager for letters,
// CQVNumLocalizerManager for digits), used by one thread and then deleted.
//
// Results: 0, LOC_ERR_PARAM for a null argument, LOC_ERR_MAP when the pinyin table cannot be
// mapped or a search finds no memory for its own tables, unless an operation says otherwise.
// Operations that need the table and are not handed one map it for the call and release it on every
// path. No store lock is taken here. The table's bytes are trusted as to meaning, not as to bounds:
// a damaged one gives wrong readings and nothing worse.
class QV_EXPORT CQVLocalizerManager
{
public:
    virtual ~CQVLocalizerManager();

    // One piece of the typed text against one character of a name; 1 = it fits, 0 = it does not
    // or the piece is null. CmpChineseWord gets a table, the character's code and record, none of
    // them to be written, the mask of the search, whether the piece is the last of the text, and
    // sets bFull to whether the piece is a whole reading; the codes of the other three are cut to
    // 16 bits. A search asks once for all characters with the same readings, with a code only
    // where the text itself has a Chinese character, then for those that it reports, with their
    // own record. The search relies on two properties: what a matcher answers depends on nothing
    // but the code, the record's readings and the piece; and where a piece fits, each of its
    // beginnings fits too.
    virtual int CmpChineseWord(PYOFWORDS* pMap, wchar_t code, PYOFWORDS& record, wchar_t* szPiece,
                               _mask_type* pMask, int bLastPiece, int& bFull) = 0;
    virtual int CmpEnglishWords(unsigned short code, wchar_t* szPiece) = 0;
    virtual int CmpOtherWords(unsigned short code, wchar_t* szPiece) = 0;
    virtual int CmpDigitalWord(unsigned short code, wchar_t* szPiece) = 0;
    // Whether a split is worth trying; looks only at element 0, the piece that ends the text.
    virtual int IsValid(android::Vector<wchar_t*>& vPieces) = 0;

    CQVLocalizerManager(const CQVLocalizerManager&) = delete;
    CQVLocalizerManager& operator=(const CQVLocalizerManager&) = delete;

    // --- The pinyin table -----------------------------------------------------------------

    // Copies the shipped table over the shared one; a shorter source leaves zeros behind it.
    // 0, or LOC_ERR_MAP: the source cannot be opened, no memory, the copy cannot be made.
    static int InitMapFile();
    // Maps the shared table read-only at *ppMap, which holds MAP_FAILED after a failed mapping.
    static int MemInit(void** ppMap);
    // Releases a mapping of MemInit; 0. Null and MAP_FAILED are left alone.
    static int MemRelease(void* pMap);

    // A mapping for callers that convert many names: its address, which is positive as a long
    // also where addresses have 32 bits, or -1 with an error line. It lives until
    // ReleasePinYinFileMapping, which returns 0, or LOC_ERR_PARAM with two error lines for a
    // handle that is not positive.
    static long CreatePinYinFileMapping();
    static int ReleasePinYinFileMapping(long hMap);

    // Record of a character (zero-terminated UTF-8) in the table, -1 when it has none.
    QV_INTERNAL static int FindRecord(const PYOFWORDS* pMap, const char* szKey);

    // Classes of codes (cut to 16 bits) and of characters.
    static bool IsHanZi(unsigned short code);
    static bool IsGBWord(unsigned short uRecord);
    static bool IsAlpha(unsigned short code);
    static bool IsDigtal(unsigned short code);
    static bool IsEnglishWord(wchar_t unit);
    static bool IsDigitalChar(wchar_t unit);
    // Whether szText begins at least one entry of g_pyWords; the empty text does.
    static bool IsPyWords(wchar_t* szText);

    // --- Name conversion (see NameConversion.cpp for the classes of characters) -------------

    // Codes of a name into szOut, 10 slots, cleared first and not terminated beyond them; only
    // the first 30 characters count. Always 1.
    static int TranslateNameToLocal(PYOFWORDS* pMap, wchar_t* szDisplayName, wchar_t* szOut);
    // Pinyin key of a name into szOut, LOC_SPELLING_BUFFER wide characters, zeroed by the caller;
    // ends with the item that passes 30 characters. Lowercases szDisplayName in place. pSorter may
    // be null: characters are found without one. Always 1.
    static int TranslateChineseToPinyin(Common_Qsort* pSorter, PYOFWORDS* pMap,
                                        wchar_t* szDisplayName, wchar_t* szOut);

    // Codes of one name, traditional characters folded, into szOut (10 slots). An empty name
    // leaves szOut alone. LOC_ERR_PARAM; -1 (not LOC_ERR_MAP) when the table cannot be mapped.
    static int GetLocalizerChars(wchar_t* szDisplayName, wchar_t* szOut);
    // The same through a handle of CreatePinYinFileMapping; an empty name gives ten zero slots.
    // Every call writes an error line with the handle. LOC_ERR_PARAM also for a handle that is
    // not positive.
    static int GetLocalizerString(long hMap, wchar_t* szDisplayName, wchar_t* szOut);
    // Codes of every record with a name into its szLocalizerKey.
    static int GetLocalizerBatch(tag_ContactsInfo* pInfo);
    // Replaces every szName by its pinyin key, an empty one by NAME_EMPTY_MARK. The 31st
    // character stays as it is. Nothing for a count of 0 or less.
    static int TransNameToPY(tag_ContactsStruct* pRecords, int iCount);

    // The typed text after the user picked the character szWord for the letters before iPos:
    // szOut (as long as szInput, szWord and a terminator together) gets szInput with szWord in
    // place of the letters from the last one before iPos that begins a reading of szWord, in
    // capitals. A szWord in ASCII is appended. szInput is lowercased in
    // place. Where no letter fits, szOut is the lowercased text and the result 0. LOC_ERR_MAP
    // also when the table has no such character. iPos is cut to the length of szInput.
    static int GetLocalizerString(wchar_t* szInput, int iPos, wchar_t* szWord, wchar_t* szOut);

    // Index character of a contact whose first code is code into szOut[0]: 'A'..'Z' or '#'; 0 for
    // a character without reading. Null arguments: nothing.
    static void GetFirstWord(PYOFWORDS* pMap, wchar_t code, wchar_t* szOut);
    // The same with the record of a Chinese code, null for the others.
    QV_INTERNAL static wchar_t IndexCharacter(wchar_t code, const PYOFWORDS* pRecord);
    // Index character '1'..'5' of a contact last contacted at llTime: less than 30, 90, 180, 360
    // days before m_llNowMs, or longer ago. Null szOut: nothing.
    void GetFirstWord(long long llTime, wchar_t* szOut);

    // Copies szSource[iFrom .. iTo - 1] to the start of szTarget, without a terminator. Nothing is
    // copied for a null pointer or a range outside 0..iLen. Always 1.
    static int SubString(const wchar_t* szSource, int iLen, wchar_t* szTarget, int iFrom, int iTo);

    // --- Search -----------------------------------------------------------------------------

    // Finds the candidates whose names the text can spell, ranks them into pResult, whose pDetail
    // has room for all candidates, and sets its iResultNum. Letters of szInput become lowercase
    // and its Chinese characters their codes, in place. bTimeOrder other than 0 makes the index
    // characters of an empty text recency digits. *pMask gets the mask of the next keys;
    // szWordOut, at least 20 wide characters, zeroed, the candidate characters without terminator.
    // LOC_ERR_PARAM also for a text longer than 10 characters (lowercased by then). After a
    // failure the out arguments are untouched.
    int DoSearch(tag_LocalizerResult* pCandidates, wchar_t* szInput, IME_SEARCH_TYPE eSearchType,
                 int bTimeOrder, tag_LocalizerResult* pResult, long* pMask, wchar_t* szWordOut);

    // Replaces the Chinese characters of the text by their codes, traditional ones folded.
    void ProcessInputCNWord(PYOFWORDS* pMap, wchar_t* szInput);

    // Adds the keys that a name character behind the matched ones offers. An input of 10
    // characters clears the mask instead. 1, or 0 for a null table.
    int CreateMaskWord(PYOFWORDS* pMap, wchar_t code);
    // The same with the record of a Chinese code, null for the others.
    QV_INTERNAL void AddNextKey(wchar_t code, const PYOFWORDS* pRecord);
    void CreateCNWordMask(PYOFWORDS* pMap, wchar_t code);

    // Appends a candidate character unless it is listed already, the list is full or its
    // nMatchLen is 0.
    void InsertCNWord(CNWORDOUTPUT& entry);

    // Sorts records by name (numbering iSortIndex) or, for an iSortType of 1, by last contact.
    // Any other value acts as 0. Always 0.
    static int LocalizerQuickSort(tag_ContactsStruct* pRecords, int iCount, int iSortType);

    // --- For callers outside: one step of a search at a time, see StepwiseSearch.cpp ---------

    // One split, its pieces last piece first, against one name: 1 when it fits from some
    // character on, the leftmost counting. Then iKeyLen, 0 before, is the number of codes from
    // there to the name's end, and bAllFull, 0 before, whether every Chinese character took a
    // whole reading; the mask and the candidate characters of the object are fed.
    int DoCompare(PYOFWORDS* pMap, tag_LocalizerDetail* pDetail, android::Vector<wchar_t*>& vPieces,
                  int& iKeyLen, int& bAllFull);

    // Keeps one match per contact: overwrites the entry with the same iIndex, else appends. 0.
    static int AddToVector(android::Vector<_MatchResult>& vMatches, _MatchResult match);
    // Sorts entries iLow..iHigh, both included, into ranking order; pDetail are the candidates. 1.
    static int LocalResultQuickSort(android::Vector<_MatchResult>& vMatches, int iLow, int iHigh,
                                    tag_LocalizerDetail* pDetail);
    // Sorts the whole vector by exchanges: quadratic, kept for callers outside.
    static void LocalResultQuickSort(android::Vector<_MatchResult>& vMatches,
                                     tag_LocalizerDetail* pDetail);

    // 1 when every matched character of the entry is a letter or other character; 0 also for null.
    static int JudgeAllEnglish(tag_LocalizerDetail* pDetail);

    // Where pRecord, whose szName is still the display name, belongs among iCount stored records:
    // 0..iCount, -1 for a null pointer or a failed mapping. In name order (any iSortType but 1)
    // the record's szName is replaced by its pinyin key.
    static int LocalizerSearchPos(tag_ContactsStruct* pRecords, int iCount,
                                  tag_ContactsStruct* pRecord, int iSortType);

protected:
    // bMatchAnywhere 0: a match begins only at a name's first character.
    explicit CQVLocalizerManager(int bMatchAnywhere);

private:
    friend class CFindings;
    friend class CSearchRun;

    // One search by CSearchRun, which keeps its matches in m_vLocateArray. Begin lowercases the
    // text and clears what the last search left; the text's length, or LOC_ERR_PARAM.
    QV_INTERNAL int BeginSearch(wchar_t* szInput);
    // Reports that characters with the record's readings took the last piece.
    QV_INTERNAL void OfferLastPiece(PYOFWORDS* pMap, PYOFWORDS& record, wchar_t* szPiece);
    QV_INTERNAL void ReadClock();
    QV_INTERNAL void EndSearch(long* pMask, wchar_t* szWordOut);

    QV_INTERNAL bool CompareRun(PYOFWORDS* pMap, const wchar_t* pCodes,
                                const android::Vector<wchar_t*>& vPieces, int& bRunFull);
    QV_INTERNAL bool ComparePiece(PYOFWORDS* pMap, wchar_t code, wchar_t* szPiece, bool bLast,
                                  int& bRunFull);
    QV_INTERNAL static void SpellName(PYOFWORDS* pMap, tag_ContactsStruct& record);

    android::Vector<_MatchResult> m_vLocateArray; // at most one per candidate
    CNWORDOUTPUT m_stCNWords[CN_WORD_MAX];        // in order of discovery
    int m_iInputLen;
    _mask_type m_stMask;
    int m_bMatchAnywhere;
    int64_t m_llNowMs; // set for an empty text in time order
};

#endif
