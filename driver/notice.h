#pragma once
// Help, version and usage texts end the run with status 0; they travel as an
// exception so that every stage can stop the run the same way.

#include <stdexcept>
#include <string>

class notice : public std::runtime_error {
public:
    explicit notice(const std::string& text) : std::runtime_error(text) {}
};
