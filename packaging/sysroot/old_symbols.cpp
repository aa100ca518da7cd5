// fcntl for libarchive's sake, which calls it by the name that old_symbols.hpp keeps the project's own
// sources from. It only marks file descriptors to be closed in children: the argument is a number, in the
// place of a pointer.
#include <fcntl.h>

extern "C" int __wrap_fcntl64(int fd, int command, void* argument) { // NOLINT: the linker's name
    return fcntl(fd, command, argument);
}
