#ifndef QV_TESTS_FAULTS_STORESTEPPER_H
#define QV_TESTS_FAULTS_STORESTEPPER_H

#include <functional>
#include <string>
#include <vector>

#if defined(__x86_64__) && !defined(__SANITIZE_ADDRESS__)
#define QV_CAN_STEP
constexpr bool CAN_STEP = true;
#else
constexpr bool CAN_STEP = false;
#endif

enum STEP_KIND
{
    STEP_STORE,  // one instruction changed strBytes at uOffset of a mapped file
    STEP_LENGTH, // a file was mapped; uOffset is its length
    STEP_FLUSH   // a file was flushed to the disk
};

// What happened to a mapped file.
struct tag_Step
{
    STEP_KIND eKind;
    bool bReg; // of the registration record, else of the records
    size_t uOffset;
    std::string strBytes;
};

// Runs a function and steps over each store to the store files' shared mappings: they are
// read-only, and the instruction that is refused runs alone with its pages writable. Where steps
// cannot be taken there are none. And sees that the store lock is held around each mapping of
// records, and the writer lock alone while they are flushed: tells in the last argument where not.
std::vector<tag_Step> StepThrough(const std::function<void()>& fnRun, std::string* pstrFault);

#endif
