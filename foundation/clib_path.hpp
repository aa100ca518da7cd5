// Directories, paths, processes and the environment: each function makes the C library's call of its name and
// turns a failure into an exception that carries the system's error text; an int result is the call's own, 0.
#pragma once

#include <sys/stat.h>
#include <sys/types.h>

#include <cstddef>

int Clib_chdir(const char* path);                     // throws ClibChdirFailedEx
int Clib_chmod(const char* path, mode_t mode);        // throws ClibChmodFailedEx
char* Clib_getcwd(char* buffer, std::size_t size);    // throws ClibPwdFailedEx; returns `buffer`
int Clib_mkdir(const char* path, mode_t mode);        // throws ExistsEx (EEXIST) or ClibMkdirFailedEx
int Clib_rmdir(const char* path);                     // throws ClibRmdirFailedEx
int Clib_unlink(const char* path);                    // throws ClibUnlinkFailedEx
int Clib_stat(const char* path, struct stat* status); // throws ClibStatFailedEx
int Clib_utime(const char* path);                     // both times become now; throws ClibUtimeFailedEx
int Clib_checkProcess(int processId);                 // throws ClibGetProcStatusFailedEx if there is none

// Puts name=value into the environment and takes it back before it returns, so that the variable no longer
// holds the text afterwards. Throws ClibPutenvFailedEx, or NoMemoryEx "No Memory\n".
int Clib_setenv(const char* name, const char* value);

// The descriptor of a new file whose name is made in place from the template's "XXXXXX", or -1 (errno set).
// A null template is fatal.
int Clib_mkstemp(char* templateFile);

// Calls that do not fail, kept here so that all use of the C library goes through one layer.
char* Clib_getenv(const char* name);
pid_t Clib_getpid();
mode_t Clib_umask(mode_t mask);
