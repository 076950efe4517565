#ifndef QV_TOOLS_OPTIONCHECKS_H
#define QV_TOOLS_OPTIONCHECKS_H

#include <cstdint>
#include <limits>

namespace CLI
{
class Validator;
}

// The end of the year 9999, in milliseconds since 1970: the last time that an option accepts.
constexpr int64_t MAX_TIME_MS = 253402300799999;
constexpr int64_t MAX_INT = std::numeric_limits<int>::max();

// Accepts whole numbers from llMin to llMax; the error message names the range.
CLI::Validator WholeNumber(int64_t llMin, int64_t llMax);

#endif
