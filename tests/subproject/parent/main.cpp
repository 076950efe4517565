// A program of a project that has the library as a subproject: program PYFILE
#include "Core/LocalizerLogic.h"
#include "Filter/FilterChain.h"

#include <filesystem>

int main(int, char** ppArguments)
{
    CLocalizerLogic logic;
    CFilterChain chain;
    const bool bWholeTable = std::filesystem::file_size(ppArguments[1]) == 709412;
    return bWholeTable ? chain.GetFilterNum() : 1;
}
