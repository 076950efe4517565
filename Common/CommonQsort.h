#ifndef QV_COMMON_COMMONQSORT_H
#define QV_COMMON_COMMONQSORT_H

#include "Common/Export.h"

// What an array holds and how it is ordered. Any int may be passed: the sorter refuses others.
enum Common_Sort_enum : int
{
    SORT_NAME = 0,  // tag_ContactsStruct by name key, nameless contacts last
    SORT_TIME = 1,  // tag_ContactsStruct by last contact, most recent first
    SORT_PYWORD = 3 // PYOFWORDS by character
};

// Sorts arrays of fixed-size records in place and searches sorted ones. One object serves calls
// of different kinds one after another, one call at a time. Nothing is allocated: a sort keeps its
// two scratch records on the stack. Any value that is not a Common_Sort_enum makes the sort and the
// searches return -1 with nothing touched.
class QV_EXPORT Common_Qsort
{
public:
    Common_Qsort();
    ~Common_Qsort(); // NOLINT(performance-trivially-destructible): programs link it
    Common_Qsort(const Common_Qsort&) = delete;
    Common_Qsort& operator=(const Common_Qsort&) = delete;

    // Makes the object ready for records of the kind. Every sort and search begins with it.
    void InitInterData(Common_Sort_enum type);

    // Sorts count records at base so that no record is QSORT_GT than its follower. Returns
    // count; -1, with nothing touched, for a null base or a count below 1. Not stable.
    int QuickSort(char* base, int count, Common_Sort_enum type);

    // The two stages of the sort on the records lo..hi, both included, after InitInterData. The
    // first leaves runs of five records or fewer to the second; the second alone sorts any range
    // and keeps equal records in their order. The stack they use does not grow with the range.
    void QuickSort1(char* base, int lo, int hi);
    void InsertionSort(char* base, int lo, int hi);

    // Searches count sorted records for key, a record of the same kind (for SORT_PYWORD only its
    // leading zero-terminated string matters).
    // bInsertPos 0: the index of an equal record, or -1. bInsertPos not 0: the index 0..count at
    // which the key keeps the order; that of an equal record if the search meets one.
    // A count of 0 or less: -1 or 0, whatever base and key are; else -1 for a null base or key.
    int Search_Bin(char* base, int count, char* key, Common_Sort_enum type, int bInsertPos);

    // Relations between two records of the current kind: 1, 0, or -1 for an unknown kind.
    // QSORT_EQ of SORT_NAME compares the names only.
    int QSORT_EQ(char* a, char* b);
    int QSORT_GT(char* a, char* b);
    int QSORT_LT(char* a, char* b);

    // --- For callers outside: nothing in the library calls this ---

    // As Search_Bin; with bInsertPos it sets *pbFound to 1 when an equal record was met, and
    // then returns that record's index. It never clears *pbFound.
    int Search_BinEx(char* base, int count, char* key, Common_Sort_enum type, int bInsertPos,
                     int* pbFound);

private:
    bool IsReady() const { return m_iRecSize > 0; }
    QV_INTERNAL bool BeginSearch(const char* base, int count, const char* key,
                                 Common_Sort_enum type, int bInsertPos, int* piResult);

    Common_Sort_enum m_eSortType = SORT_NAME;
    int m_iRecSize = 0; // bytes, 0 for an unknown kind
};

#endif
