// A program of a project that has the library as a subproject.
#include "Core/LocalizerLogic.h"
#include "Filter/FilterChain.h"

#include <cstdio>

int main(int argc, char** argv)
{
    CLocalizerLogic logic;
    CFilterChain chain;
    std::FILE* pTable = argc > 1 ? std::fopen(argv[1], "rb") : nullptr;
    if (pTable == nullptr)
    {
        return 1;
    }
    std::fseek(pTable, 0, SEEK_END);
    std::printf("%ld %d\n", std::ftell(pTable), chain.GetFilterNum());
    std::fclose(pTable);
    return 0;
}
