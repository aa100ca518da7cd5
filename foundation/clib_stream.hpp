// Standard streams and formatting: each function makes the C library's call of its name and turns a failure
// into an exception. The fixed messages differ in their line ends from one another; each is meant. Streams
// and buffers stay the caller's.
#pragma once

#include <cstdarg>
#include <cstddef>
#include <cstdio>

// How a stream is opened. Any other value opens nothing: the call fails with EINVAL.
enum ClibFileMode : int {
    ClibFM_Read = 1,       // "r"
    ClibFM_Write = 2,      // "w"
    ClibFM_ReadUpdate = 3, // "r+"
    ClibFM_Append = 4,     // "a"
    ClibFM_WriteUpdate = 5 // "w+"; unknown to Clib_freopen
};

// Throw OpenFailedEx with the system's error text.
std::FILE* Clib_fopen(const char* path, int mode);
std::FILE* Clib_fdopen(int fd, int mode);
std::FILE* Clib_freopen(const char* path, int mode, std::FILE* stream);

int Clib_fclose(std::FILE* stream); // throws CloseFailedEx with the system's error text

// Throw ReadFailedEx "File read failed". The end of the file is no failure: a short count, or null.
std::size_t Clib_fread(void* buffer, std::size_t size, std::size_t count, std::FILE* stream);
char* Clib_fgets(char* buffer, int size, std::FILE* stream);
int Clib_fscanf(std::FILE* stream, const char* format, ...) __attribute__((format(scanf, 2, 3)));

// Throws ReadFailedEx "File read failed\n".
int Clib_scanf(const char* format, ...) __attribute__((format(scanf, 1, 2)));

// Throws ReadFailedEx "String Read failed\n" when the text ends before the first conversion.
int Clib_sscanf(const char* text, const char* format, ...) __attribute__((format(scanf, 2, 3)));

// Throw WriteFailedEx "File write failed". Clib_fwrite fails when nothing at all was written.
std::size_t Clib_fwrite(const void* buffer, std::size_t size, std::size_t count, std::FILE* stream);
int Clib_fprintf(std::FILE* stream, const char* format, ...) __attribute__((format(printf, 2, 3)));

// Throws WriteFailedEx "File write failed\n".
int Clib_vfprintf(std::FILE* stream, const char* format, std::va_list arguments)
    __attribute__((format(printf, 2, 0)));

// Throw WriteFailedEx "Stdout Write failed" and "Stdout Write failed\n".
int Clib_printf(const char* format, ...) __attribute__((format(printf, 1, 2)));
int Clib_vprintf(const char* format, std::va_list arguments) __attribute__((format(printf, 1, 0)));

int Clib_putchar(int character); // throws WriteFailedEx "Putting character on Stdout failed"

// Throw WriteFailedEx "String Write failed\n". Clib_snprintf writes at most `size` bytes with the NUL and
// returns the length of the whole text; the other two need room for the whole text and its NUL.
int Clib_snprintf(char* buffer, std::size_t size, const char* format, ...)
    __attribute__((format(printf, 3, 4)));
int Clib_sprintf(char* buffer, const char* format, ...) __attribute__((format(printf, 2, 3)));
int Clib_vsprintf(char* buffer, const char* format, std::va_list arguments)
    __attribute__((format(printf, 2, 0)));
