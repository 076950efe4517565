#include "Platform/LogSink.h"
#include "tests/faults/Options.h"

#include <cstdlib>
#include <cstring>
#include <gtest/gtest.h>

tag_Options g_options;

int main(int argc, char** argv)
{
    testing::InitGoogleTest(&argc, argv);
    for (int i = 1; i + 1 < argc; i += 2)
    {
        const bool bSeconds = std::strcmp(argv[i], "--seconds") == 0;
        unsigned int& uOption = bSeconds ? g_options.uSeconds : g_options.uSeed;
        uOption = static_cast<unsigned int>(std::atoi(argv[i + 1]));
    }
    CLogSink::Set([](void*, int, const char*, const char*) {}, nullptr);
    return RUN_ALL_TESTS();
}
