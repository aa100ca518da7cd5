// Time and sleeping: each function makes the C library's call of its name and turns a failure into an
// exception.
#pragma once

#include <cstddef>
#include <ctime>

#include "foundation/integers.hpp"

std::time_t Clib_time(std::time_t* time); // throws ClibGetTimeFailedEx "Time() failed"

// Writes the 26-byte text of a time into `buffer` (whose `length` is not looked at) and returns it.
// Throws ClibGetTimeFailedEx "Ctime() failed".
char* Clib_ctime(const std::time_t* time, char* buffer, std::size_t length);

std::time_t Clib_mktime(std::tm* parts);                          // "mktime() failed\n"
std::tm* Clib_gmtime(const std::time_t* time, std::tm* parts);    // "Gmtime() failed\n"
std::tm* Clib_localtime(const std::time_t* time, std::tm* parts); // "Localtime() failed\n"

// The wall clock: seconds, and the whole milliseconds within the second (0 to 999, the rest cut off).
// Throws ClibGetTimeFailedEx with the system's error text.
void Clib_gettimeofday(uint32& seconds, uint16& milliseconds);

// Return 0. Throw ClibSleepFailedEx with the system's error text.
int Clib_msleep(uint32 milliseconds);
int Clib_usleep(uint32 microseconds);

unsigned Clib_sleep(unsigned seconds); // the seconds left when a signal came
