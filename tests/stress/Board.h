#ifndef QV_TESTS_STRESS_BOARD_H
#define QV_TESTS_STRESS_BOARD_H

#include <atomic>
#include <cstdint>
#include <string>

// What the processes of one round tell each other, in a file that all of them map.
struct tag_Board
{
    static constexpr int MAX_IDS = 400;

    // The provider's changes: number iBegun is under way or done, number iDone is done and the
    // store's state after it is written down.
    std::atomic<int32_t> iBegun;
    std::atomic<int32_t> iDone;
    std::atomic<int32_t> iReady; // the first index is built
    std::atomic<int32_t> iGo;
    std::atomic<int32_t> iStop;
    std::atomic<int32_t> iHolds; // how often the lock was held to annoy the others

    // The change that a process to be killed works on.
    std::atomic<int64_t> llMicroseconds; // how long it took when it was not killed
    std::atomic<int32_t> iIds;
    int32_t aiIds[MAX_IDS];
};

class CBoard
{
public:
    // Creates the file if it is missing; std::runtime_error when it cannot be mapped.
    explicit CBoard(const std::string& strRoot);
    ~CBoard();
    CBoard(const CBoard&) = delete;
    CBoard& operator=(const CBoard&) = delete;

    tag_Board* operator->() const { return m_pBoard; }

private:
    tag_Board* m_pBoard;
};

#endif
