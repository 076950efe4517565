// test_faults [--seed N] [--seconds N]

#include "Platform/LogSink.h"
#include "tests/faults/StoreCase.h"

#include <cstdlib>
#include <gtest/gtest.h>

unsigned int g_uSeed = 1;
unsigned int g_uSeconds = 2;

int main(int argc, char** argv)
{
    testing::InitGoogleTest(&argc, argv);
    for (int i = 1; i + 1 < argc; i += 2)
    {
        unsigned int& uOption = argv[i] == std::string("--seconds") ? g_uSeconds : g_uSeed;
        uOption = static_cast<unsigned int>(std::atoi(argv[i + 1]));
    }
    CLogSink::Set([](void*, int, const char*, const char*) {}, nullptr);
    return RUN_ALL_TESTS();
}
