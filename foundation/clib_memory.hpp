// Memory, text and byte-order calls of the C library under the layer's names. Only Clib_strdup can fail.
#pragma once

#include <arpa/inet.h>

#include <cstdlib>
#include <cstring>

// A malloc'ed copy of the text, the caller's to free. Throws NoMemoryEx "No memory available for strdup()\n".
char* Clib_strdup(const char* text);

inline void* Clib_memcpy(void* target, const void* source, std::size_t length) {
    return std::memcpy(target, source, length);
}
inline void* Clib_memmove(void* target, const void* source, std::size_t length) {
    return std::memmove(target, source, length);
}
inline void* Clib_memset(void* target, int byte, std::size_t length) {
    return std::memset(target, byte, length);
}
// The two copies need room for the whole text and its NUL, and return the target.
inline char* Clib_strcat(char* target, const char* source) {
    return std::strcat(target, source); // NOLINT(clang-analyzer-security.insecureAPI.strcpy)
}
inline char* Clib_strcpy(char* target, const char* source) {
    return std::strcpy(target, source); // NOLINT(clang-analyzer-security.insecureAPI.strcpy)
}
inline const char* Clib_strstr(const char* text, const char* part) {
    return std::strstr(text, part);
}
inline const char* Clib_strcasestr(const char* text, const char* part) {
    return strcasestr(text, part);
}
inline std::size_t Clib_strlen(const char* text) {
    return std::strlen(text);
}
inline int Clib_strcmp(const char* a, const char* b) {
    return std::strcmp(a, b);
}
inline int Clib_strncmp(const char* a, const char* b, std::size_t length) {
    return std::strncmp(a, b, length);
}
inline char* Clib_strncat(char* target, const char* source, std::size_t length) {
    return std::strncat(target, source, length);
}
inline char* Clib_strncpy(char* target, const char* source, std::size_t length) {
    return std::strncpy(target, source, length);
}
inline char* Clib_strtok_r(char* text, const char* separators, char** state) {
    return strtok_r(text, separators, state);
}
inline int Clib_strcasecmp(const char* a, const char* b) {
    return strcasecmp(a, b);
}
inline int Clib_strncasecmp(const char* a, const char* b, std::size_t length) {
    return strncasecmp(a, b, length);
}
inline int Clib_rand() {
    return std::rand(); // NOLINT(cert-msc30-c,cert-msc50-cpp): the C library's generator is what is asked for
}
inline uint32_t Clib_htonl(uint32_t value) {
    return htonl(value);
}
inline uint32_t Clib_ntohl(uint32_t value) {
    return ntohl(value);
}
inline uint16_t Clib_htons(uint16_t value) {
    return htons(value);
}
inline uint16_t Clib_ntohs(uint16_t value) {
    return ntohs(value);
}
