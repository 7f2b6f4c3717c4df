// A Markdown table with aligned columns.
#pragma once

#include <ostream>
#include <string>
#include <vector>

class Table {
public:
    explicit Table(std::vector<std::string> header);

    // As many cells as the header has.
    void add(std::vector<std::string> row);

    // The first column is set to the left, the others to the right.
    void write(std::ostream& output) const;

private:
    std::vector<std::vector<std::string>> fRows; // the header first
};
