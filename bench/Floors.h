#ifndef QV_BENCH_FLOORS_H
#define QV_BENCH_FLOORS_H

#include <functional>

// What no search and no build can beat on this machine, measured in the same run. All times are
// seconds, the median of MEASURE_RUNS runs.

constexpr int MEASURE_RUNS = 9;

double MedianSeconds(int iRuns, const std::function<void()>& fnWork,
                     const std::function<void()>& fnAfter = {});

// Map the store file, copy the records of iContacts into memory that was touched before, unmap.
double CopyFloor(int iContacts);
// Map the store file, read 8 bytes of the localizer key of each of iContacts records, unmap.
double TouchFloor(int iContacts);
// As CopyFloor, into memory fresh from the system.
double CopyFreshFloor(int iContacts);
// Read every byte of iEntries result entries.
double ScanFloor(int iEntries);
// Copy iEntries result entries into fresh memory.
double EntriesFloor(int iEntries);
// Sort iMatches matches, in no order, by one number each.
double SortFloor(int iMatches);
// Step through the statements of a full read and its online status, every column fetched.
double SqlFloor();
// Step through the statement that counts the visible contacts.
double CountQueryFloor();
// Copy the records of iContacts into a shared mapping of an existing file.
double RewriteFloor(int iContacts);

#endif
