#include "tests/stress/Board.h"

#include <fcntl.h>
#include <stdexcept>
#include <sys/mman.h>
#include <unistd.h>

CBoard::CBoard(const std::string& strRoot) : m_pBoard(nullptr)
{
    const int iFd = open((strRoot + "/board").c_str(), O_RDWR | O_CREAT, 0666);
    void* pAddr = MAP_FAILED;
    if (iFd >= 0 && ftruncate(iFd, sizeof(tag_Board)) == 0)
    {
        pAddr = mmap(nullptr, sizeof(tag_Board), PROT_READ | PROT_WRITE, MAP_SHARED, iFd, 0);
    }
    close(iFd);
    if (pAddr == MAP_FAILED)
    {
        throw std::runtime_error("no board in " + strRoot);
    }
    m_pBoard = static_cast<tag_Board*>(pAddr);
}

CBoard::~CBoard()
{
    munmap(m_pBoard, sizeof(tag_Board));
}
