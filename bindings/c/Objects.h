#ifndef QV_BINDINGS_OBJECTS_H
#define QV_BINDINGS_OBJECTS_H

// The objects behind the handles of the C interface, and code that its functions share.

#include "Core/LocalizerLogic.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "MemManager/MemManger.h"
#include "bindings/c/Utf8Text.h"
#include "bindings/c/qvlocalize.h"

static_assert(QV_MAX_TYPED == LOC_MAX_INPUT, "the search takes as many");

struct qv_index
{
    CLocalizerLogic m_logic;
};

struct qv_result
{
    qv_result() = default;
    ~qv_result() { CMemManger().FreeSearchResult(m_pSet); }
    qv_result(const qv_result&) = delete;
    qv_result& operator=(const qv_result&) = delete;

    tag_LocalizerResult* m_pSet = nullptr;
    uint32_t m_uNextKeys = 0;
    bool m_bOfEmptyText = false;
    char m_szCandidates[CN_WORD_MAX * UTF8_MAX_BYTES + 1] = {};
};

// Decodes a whole text of at most iMaxUnits characters.
inline int DecodeShort(const char* szText, wchar_t* szTarget, int iMaxUnits)
{
    const int iUnits = DecodeText(szText, szTarget, iMaxUnits);
    if (iUnits < 0)
    {
        return QV_ERROR_UTF8;
    }
    return iUnits <= iMaxUnits ? QV_OK : QV_ERROR_TOO_LONG;
}

#endif
