// What a function writes to a FILE stream, captured in memory.
#pragma once

#include <cstdio>
#include <cstdlib>
#include <string>

/// Calls \p write(FILE*) on an in-memory stream and returns what it wrote.
template <class Write>
std::string writtenToFile(Write write)
{
    char* text = nullptr;
    size_t size = 0;
    FILE* f = open_memstream(&text, &size);
    write(f);
    std::fclose(f);
    std::string s(text, size);
    std::free(text);
    return s;
}
