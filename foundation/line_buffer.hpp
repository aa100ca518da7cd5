// Reading a stream line by line.
#pragma once

#include <cstddef>
#include <cstdio>

// Lines of any length, one at a time, in memory that grows with the longest.
class LineBuffer {
public:
    LineBuffer();
    LineBuffer(const LineBuffer&) = delete;
    LineBuffer& operator=(const LineBuffer&) = delete;
    ~LineBuffer();

    // The next line with its line feed, owned by the buffer and good until the next call; null at the end of
    // the stream, on a read error and when memory runs out.
    char* next(std::FILE* stream);

private:
    char* mLine;
    std::size_t mSize;
};
