#ifndef QV_TESTS_FAULTS_READINGS_H
#define QV_TESTS_FAULTS_READINGS_H

// The calls of the facade that change nothing.

#include "Core/LocalizerCodes.h"
#include "Core/LocalizerLogic.h"

#include <string>
#include <vector>

// What a call hands out. Nothing in here allocates.
struct tag_Answer
{
    int iRet = -1;
    tag_LocalizerResult* pResult = nullptr;
    long lMask = 0;
    wchar_t szText[64] = {};
};

struct tag_Reading
{
    const char* szName;
    void (*pfnRead)(CLocalizerLogic& logic, tag_Answer& answer);
};

const std::vector<tag_Reading>& AllReadings();

// Whether it is a result code of the facade's.
inline bool IsResult(int iRet)
{
    return iRet == 0 || iRet == -1 || iRet == LOC_ERR_MAP;
}

// The whole of an answer, whose set is released; "0 nobody" for a search that finds nobody.
std::string TextOf(CLocalizerLogic& logic, const tag_Answer& answer);

#endif
