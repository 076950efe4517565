#ifndef QV_TESTS_FAULTS_OPTIONS_H
#define QV_TESTS_FAULTS_OPTIONS_H

// What the program was started with: test_faults [--seed N] [--seconds N].
struct tag_Options
{
    unsigned int uSeed = 1;
    unsigned int uSeconds = 2; // that the readers run
};
extern tag_Options g_options;

#endif
