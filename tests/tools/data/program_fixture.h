// The program as a user runs it, in a scratch directory, and the shared data set.
#pragma once

#include <fmt/format.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/wait.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <vector>

#include "data/manifest.h"
#include "data/output_directory.h"
#include "tools/data/scratch_directory.h"

namespace tessaly::data {

namespace fs = std::filesystem;

struct Outcome {
    int code = -1;
    std::string output;
    std::string errors;
};

class Program : public testing::Test {
protected:
    /// @param before  shell commands before it
    Outcome run(const std::string& arguments, const std::string& before = "") {
        const fs::path output = scratch.path() / ".stdout";
        const fs::path errors = scratch.path() / ".stderr";
        const std::string command =
            fmt::format("cd '{}' && {{ {} '{}' {}; }} > .stdout 2> .stderr",
                        scratch.path().string(), before, TESSALY_DATA_PROGRAM, arguments);
        const int status = std::system(command.c_str());
        Outcome outcome{WIFEXITED(status) ? WEXITSTATUS(status) : -1, readIfPresent(output),
                        readIfPresent(errors)};
        fs::remove(output);
        fs::remove(errors);
        return outcome;
    }
    /// One line on the error stream, a non-zero code, and no output directory.
    void expectRefusal(const std::string& arguments, const std::string& message) {
        const Outcome outcome = run(arguments);
        EXPECT_EQ(outcome.code, 1) << arguments;
        EXPECT_THAT(outcome.errors, testing::AllOf(testing::HasSubstr("tessaly-data: "),
                                                   testing::HasSubstr(message)));
        EXPECT_EQ(std::count(outcome.errors.begin(), outcome.errors.end(), '\n'), 1)
            << outcome.errors;
        EXPECT_EQ(outcome.output, "");
        EXPECT_FALSE(fs::exists(scratch.path() / "out")) << arguments;
    }
    static bool dataSetPresent() { return fs::exists(fs::path(TESSALY_TEST_DATA) / manifestName); }

    ScratchDirectory scratch;
};

class BuiltData : public Program {
protected:
    void SetUp() override {
        if (!dataSetPresent()) {
            GTEST_SKIP() << "no data set in " << TESSALY_TEST_DATA;
        }
    }
    /// A directory with the smallest files of the set.
    void copySet(const std::vector<const char*>& names) {
        fs::create_directory(scratch.path() / "set");
        for (const char* name : names) {
            fs::copy_file(fs::path(TESSALY_TEST_DATA) / name, scratch.path() / "set" / name);
        }
    }
};

}  // namespace tessaly::data
