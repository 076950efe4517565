// A program of a project that has the library as a subproject.
#include "Core/LocalizerLogic.h"
#include "Filter/FilterChain.h"

int main()
{
    CLocalizerLogic logic;
    CFilterChain chain;
    return chain.GetFilterNum();
}
