// All files or none.
#include "data/output_directory.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <fstream>

#include "data/data_error.h"
#include "tools/data/scratch_directory.h"

namespace tessaly::data {
namespace {

namespace fs = std::filesystem;

TEST(OutputDirectory, CommitWritesAllFilesAndNothingElse) {
    const ScratchDirectory scratch;
    const fs::path directory = scratch.path() / "a" / "b";
    {
        OutputDirectory output(directory);
        output.add("one", "1");
        output.add("two", std::string("\0two", 4));
        EXPECT_FALSE(fs::exists(directory / "one"));
        output.commit();
    }
    EXPECT_EQ(readIfPresent(directory / "one"), "1");
    EXPECT_EQ(readIfPresent(directory / "two"), std::string("\0two", 4));
    EXPECT_EQ(std::distance(fs::directory_iterator(directory), fs::directory_iterator()), 2);
}

TEST(OutputDirectory, WithoutCommitNothingIsLeft) {
    const ScratchDirectory scratch;
    {
        OutputDirectory output(scratch.path() / "a" / "b");
        output.add("one", "1");
    }
    EXPECT_EQ(scratch.entryCount(), 0);
}

TEST(OutputDirectory, ExistingFilesStayUntilCommit) {
    const ScratchDirectory scratch;
    std::ofstream(scratch.path() / "one") << "old";
    {
        OutputDirectory output(scratch.path());
        output.add("one", "new");
        EXPECT_EQ(readIfPresent(scratch.path() / "one"), "old");
    }
    EXPECT_EQ(readIfPresent(scratch.path() / "one"), "old");
    OutputDirectory output(scratch.path());
    output.add("one", "new");
    output.commit();
    EXPECT_EQ(readIfPresent(scratch.path() / "one"), "new");
    EXPECT_EQ(scratch.entryCount(), 1);
}

TEST(OutputDirectory, AFailureHalfWayPutsFormerFilesBack) {
    const ScratchDirectory scratch;
    std::ofstream(scratch.path() / "one") << "old one";
    std::ofstream(scratch.path() / "two") << "old two";
    {
        OutputDirectory output(scratch.path());
        output.add("two", "new two");
        output.add("new", "nothing before");
        output.add("one", "new one");
        output.add("one", "a second file of this name has no passing file left");
        EXPECT_THROW(output.commit(), DataError);
    }
    EXPECT_EQ(readIfPresent(scratch.path() / "one"), "old one");
    EXPECT_EQ(readIfPresent(scratch.path() / "two"), "old two");
    EXPECT_EQ(scratch.entryCount(), 2);
}

TEST(OutputDirectory, ATargetThatIsADirectoryStopsAllFiles) {
    const ScratchDirectory scratch;
    fs::create_directory(scratch.path() / "two");
    {
        OutputDirectory output(scratch.path());
        output.add("one", "1");
        output.add("two", "2");
        EXPECT_THROW(output.commit(), DataError);
    }
    EXPECT_EQ(scratch.entryCount(), 1);
}

TEST(OutputDirectory, PlacesThatCannotBeDirectoriesAreNamed) {
    const ScratchDirectory scratch;
    std::ofstream(scratch.path() / "file") << "x";
    for (const fs::path& path : {scratch.path() / "file", scratch.path() / "file" / "below"}) {
        try {
            const OutputDirectory output(path);
            FAIL() << path;
        } catch (const DataError& error) {
            EXPECT_THAT(error.what(), testing::HasSubstr(path.string()));
        }
    }
    EXPECT_EQ(scratch.entryCount(), 1);
}

TEST(OutputDirectory, ReadOnlyPlacesAreRefusedAtOnce) {
    const ScratchDirectory scratch;
    fs::permissions(scratch.path(), fs::perms::owner_read | fs::perms::owner_exec);
    // The superuser may write anywhere: there a kernel file system stands in.
    const fs::path place = geteuid() == 0 ? fs::path("/proc/self") : scratch.path();
    EXPECT_THROW(OutputDirectory{place}, DataError);
    EXPECT_THROW(OutputDirectory{place / "below"}, DataError);
    fs::permissions(scratch.path(), fs::perms::owner_all);
    EXPECT_EQ(scratch.entryCount(), 0);
}

}  // namespace
}  // namespace tessaly::data
