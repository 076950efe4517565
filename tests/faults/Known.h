#ifndef QV_TESTS_FAULTS_KNOWN_H
#define QV_TESTS_FAULTS_KNOWN_H

#include <string>

// What is known not to hold yet: the beginning of a case's name and a part of its finding.
struct tag_Known
{
    const char* szCase;
    const char* szFinding;
};
constexpr tag_Known KNOWN[] = {
    // A first pinyin table that could not be written is full of zeros, by which names are kept.
    {"FirstBuild", "the next process finds: contact 1 differs from contact 1 from byte 512"},
};

inline bool IsKnown(const std::string& strCase, const std::string& strFinding)
{
    for (const tag_Known& known : KNOWN)
    {
        if (strCase.find(known.szCase) == 0 &&
            strFinding.find(known.szFinding) != std::string::npos)
        {
            return true;
        }
    }
    return false;
}

#endif
