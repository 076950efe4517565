#ifndef QV_TESTS_SUPPORT_MEMORYFAILURE_H
#define QV_TESTS_SUPPORT_MEMORYFAILURE_H

// For as long as the object lives, memory runs out: of the allocations that report their failure
// (new (std::nothrow) and realloc) the first iGranted succeed and all later ones fail. One object
// at a time, in one thread. A test program that uses it allocates through its operators.
class CMemoryFailure
{
public:
    explicit CMemoryFailure(int iGranted);
    ~CMemoryFailure();
    CMemoryFailure(const CMemoryFailure&) = delete;
    CMemoryFailure& operator=(const CMemoryFailure&) = delete;
};

// What a call returns when memory runs out after so many allocations.
template <typename Fn>
auto WithMemoryFor(int iGranted, const Fn& fnCall)
{
    const CMemoryFailure failure(iGranted);
    return fnCall();
}

#endif
