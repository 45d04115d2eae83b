// A row of the tables of command lines, each of which stands in the file of its commands.

#pragma once

#include <gtest/gtest.h>

#include <ostream>

struct Row {
    const char* commands;
    int status;
    const char* out;  ///< a part of standard output; "" if it must be empty, null if it may be all
    const char* err;  ///< the same of standard error
};

inline void PrintTo(const Row& row, std::ostream* stream) {
    *stream << row.commands;
}

/// One command line: its status, its streams, and the same in JSON lines.
class CommandLine : public testing::TestWithParam<Row> {};

/// Several of them: the status of the last, and what they have said together.
class CommandLineStory : public testing::TestWithParam<Row> {};
