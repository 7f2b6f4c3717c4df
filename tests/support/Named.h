// The names of rows in tables of tests.
#pragma once

#include <ostream>

// A row of a table of tests is derived from its name, which is its first initialiser.
struct Named {
    // Implicit, so that a row begins with the text.
    Named(const char* text) : name(text) {}

    const char* name;
    friend std::ostream& operator<<(std::ostream& out, const Named& row) { return out << row.name; }
};
