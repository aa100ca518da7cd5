// Descriptors: each function makes the C library's call of its name and turns a failure into an exception
// that carries the system's error text. Descriptors stay the caller's.
#pragma once

#include <sys/types.h>

#include <cstddef>

int Clib_open(const char* path, int flags, mode_t mode);     // throws OpenFailedEx
int Clib_creat(const char* path, mode_t mode);               // throws CreateFailedEx
int Clib_close(int fd);                                      // throws CloseFailedEx
ssize_t Clib_read(int fd, void* buffer, std::size_t length); // throws ReadFailedEx
int Clib_dup(int fd);                                        // throws ClibDupFailedEx
int Clib_dup2(int oldFd, int newFd);                         // throws ClibDup2FailedEx

// Reads until `length` bytes are there or the file ends; returns how many are. An error before the first byte
// throws TryAgainEx (EAGAIN) or ReadFailedEx; a later one only makes the count short.
std::size_t Clib_readAll(int fd, void* buffer, std::size_t length);

// Writes until `length` bytes are gone or none goes any more; returns how many went. An error before the
// first byte throws WriteFailedEx; a later one only makes the count short.
std::size_t Clib_writeAll(int fd, const void* buffer, std::size_t length);
