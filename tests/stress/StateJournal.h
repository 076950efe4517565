#ifndef QV_TESTS_STRESS_STATEJOURNAL_H
#define QV_TESTS_STRESS_STATEJOURNAL_H

#include "tests/Support/StoreImage.h"

#include <string>

// The states that the store went through, one file each, numbered from 0.
class CStateJournal
{
public:
    explicit CStateJournal(const std::string& strRoot) : m_strBase(strRoot + "/state.") {}

    void Write(int iState, const tag_StoreImage& image) const;
    tag_StoreImage Read(int iState) const;

private:
    std::string m_strBase;
};

// What is wrong with a state, empty when nothing is: contacts twice, records that no build makes
// and, where the capacity does not ask for a rebuild, another order than that of the sort type.
std::string FaultOf(const tag_StoreImage& image);

// Throws std::runtime_error, which begins with the text, unless the store of strRoot, the present
// root, is what a fresh build makes and asks for no rebuild.
void RequireFreshStore(const std::string& strRoot, const std::string& strText);

// Makes the image the store of the library's present root. The sort type is given apart.
void InstallStore(const tag_StoreImage& image, int iSortType);

#endif
