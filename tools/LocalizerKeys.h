#ifndef QV_TOOLS_LOCALIZERKEYS_H
#define QV_TOOLS_LOCALIZERKEYS_H

#include "Core/LocalizerLogic.h"

#include <string>

// Computes the column `localizerkey` as the provider does: opens the shared pinyin table once and
// asks the library for the codes of each name. Every operation throws CToolError.
class CLocalizerKeys
{
public:
    // First copies the shipped table to the shared one if that is missing or bRenew is true.
    explicit CLocalizerKeys(bool bRenew);
    ~CLocalizerKeys();
    CLocalizerKeys(const CLocalizerKeys&) = delete;
    CLocalizerKeys& operator=(const CLocalizerKeys&) = delete;

    // The codes, in UTF-8, of a name in UTF-8.
    std::string KeyOf(const std::string& strName);

private:
    CLocalizerLogic m_logic;
    long m_hMapping;
};

#endif
