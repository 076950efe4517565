#ifndef QV_TESTS_STRESS_STOREFAULTS_H
#define QV_TESTS_STRESS_STOREFAULTS_H

#include "tests/Support/StoreImage.h"

#include <string>

// What is wrong with a state, empty when nothing is: contacts twice, records that no build makes
// and, where the capacity does not ask for a rebuild, another order than that of the sort type.
std::string FaultOf(const tag_StoreImage& image);

// Throws std::runtime_error, which begins with the text, unless the store of strRoot, the present
// root, is what a fresh build makes and asks for no rebuild.
void RequireFreshStore(const std::string& strRoot, const std::string& strText);

#endif
