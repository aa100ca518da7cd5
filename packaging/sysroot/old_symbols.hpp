// Included into every source of the 32-bit programs. Where file offsets have 64 bits, the C library's headers
// call fcntl by a name that glibc has since 2.28; only file locks, which nothing here sets, differ from the
// first one.
__asm__(".symver fcntl64, fcntl@GLIBC_2.0");
