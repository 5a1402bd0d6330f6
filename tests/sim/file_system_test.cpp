// The controller's in-memory disks: paths in any spelling, folders made and
// removed with what they hold, copies that refuse to overwrite or to copy a
// folder into itself, sizes, listings, devices plugged in and out.
#include <gtest/gtest.h>

#include "sim/file_system.h"

namespace tav::sim {
namespace {

using Result = FileSystem::Result;

TEST(FileSystemTest, PathsAreNormalisedOrRefused) {
    struct Case {
        const OLECHAR* path;
        std::optional<Text> expected;
    } cases[] = {
        {OLESTR("/hd0a/temp"), Text(OLESTR("hd0a/temp"))},
        {OLESTR("hd0a//temp/"), Text(OLESTR("hd0a/temp"))},
        {OLESTR("/"), Text()},
        {OLESTR(""), Text()},
        {OLESTR("hd0a\\temp"), std::nullopt},
        {OLESTR("hd0a/../etc"), std::nullopt},
        {OLESTR("./hd0a"), std::nullopt},
    };
    for (const Case& c : cases) {
        EXPECT_EQ(FileSystem::Normalise(c.path), c.expected) << Narrow(c.path);
    }
}

TEST(FileSystemTest, FilesNeedTheirFolderAndFoldersAreMadeWithTheirParents) {
    FileSystem files;
    EXPECT_EQ(files.Write(OLESTR("/hd0a/new/a.txt"), "x"), Result::NoParent);
    EXPECT_EQ(files.MakeFolders(OLESTR("/hd0a/new/deep")), Result::Done);
    EXPECT_EQ(files.MakeFolders(OLESTR("/hd0a/new/deep")), Result::Done) << "making an existing folder is no error";
    EXPECT_EQ(files.Write(OLESTR("/hd0a/new/a.txt"), "abc"), Result::Done);
    EXPECT_EQ(files.Size(OLESTR("hd0a/new/a.txt")), 3u);
    EXPECT_EQ(files.Write(OLESTR("/hd0a/new/deep"), "x"), Result::IsAFolder);
    EXPECT_EQ(files.MakeFolders(OLESTR("/hd0a/new/a.txt/b")), Result::NotAFolder);
    EXPECT_EQ(files.Write(OLESTR("/hd0a/new/a.txt/b"), "x"), Result::NotAFolder);
    EXPECT_FALSE(files.Size(OLESTR("/hd0a/new")).has_value());
}

TEST(FileSystemTest, RemovingAFolderTakesOnlyWhatIsBelowIt) {
    FileSystem files;
    ASSERT_EQ(files.MakeFolders(OLESTR("/hd0a/x/y")), Result::Done);
    ASSERT_EQ(files.Write(OLESTR("/hd0a/x/y/f"), "1"), Result::Done);
    // Names that sort between "x" and "x/..." stay.
    ASSERT_EQ(files.MakeFolders(OLESTR("/hd0a/x-keep")), Result::Done);
    ASSERT_EQ(files.Write(OLESTR("/hd0a/x.keep"), "2"), Result::Done);
    EXPECT_EQ(files.Remove(OLESTR("/hd0a/x")), Result::Done);
    EXPECT_FALSE(files.Exists(OLESTR("/hd0a/x/y/f")));
    EXPECT_FALSE(files.Exists(OLESTR("/hd0a/x")));
    EXPECT_TRUE(files.IsFolder(OLESTR("/hd0a/x-keep")));
    EXPECT_TRUE(files.Exists(OLESTR("/hd0a/x.keep")));
    EXPECT_EQ(files.Remove(OLESTR("/hd0a/x")), Result::NotFound);
    EXPECT_EQ(files.Remove(OLESTR("/")), Result::BadPath);
}

TEST(FileSystemTest, CopiesTakeWholeTreesAndRefuseWhatTheyCannotDo) {
    FileSystem files;
    ASSERT_EQ(files.MakeFolders(OLESTR("/hd0a/src/sub")), Result::Done);
    ASSERT_EQ(files.Write(OLESTR("/hd0a/src/sub/f"), "data"), Result::Done);
    ASSERT_EQ(files.Write(OLESTR("/hd0a/src-sibling"), "no"), Result::Done);

    EXPECT_EQ(files.Copy(OLESTR("/hd0a/src"), OLESTR("/hd0a/dst")), Result::Done);
    ASSERT_NE(files.Read(OLESTR("/hd0a/dst/sub/f")), nullptr);
    EXPECT_EQ(*files.Read(OLESTR("/hd0a/dst/sub/f")), "data");
    EXPECT_FALSE(files.Exists(OLESTR("/hd0a/dst-sibling")));
    EXPECT_EQ(files.UsedBelow(OLESTR("/hd0a/dst")), 4u);

    EXPECT_EQ(files.Copy(OLESTR("/hd0a/src"), OLESTR("/hd0a/dst")), Result::AlreadyThere);
    EXPECT_EQ(files.Copy(OLESTR("/hd0a/none"), OLESTR("/hd0a/z")), Result::NotFound);
    EXPECT_EQ(files.Copy(OLESTR("/hd0a/src"), OLESTR("/hd0a/src/sub/inner")), Result::BadPath);
    EXPECT_EQ(files.Copy(OLESTR("/hd0a/src"), OLESTR("/hd0a/nofolder/z")), Result::NoParent);
}

TEST(FileSystemTest, ListingsShowOneLevelWithSizes) {
    FileSystem files;
    ASSERT_EQ(files.MakeFolders(OLESTR("/usb1/a")), Result::Done);
    ASSERT_EQ(files.Write(OLESTR("/usb1/a/f"), "12345"), Result::Done);
    ASSERT_EQ(files.Write(OLESTR("/usb1/g"), "1"), Result::Done);
    const auto listing = files.List(OLESTR("/usb1"));
    ASSERT_TRUE(listing.has_value());
    ASSERT_EQ(listing->size(), 2u);
    EXPECT_EQ((*listing)[0].name, OLESTR("a"));
    EXPECT_TRUE((*listing)[0].folder);
    EXPECT_EQ((*listing)[0].size, 5u);
    EXPECT_EQ((*listing)[1].name, OLESTR("g"));
    EXPECT_FALSE(files.List(OLESTR("/usb1/g")).has_value());
}

TEST(FileSystemTest, DevicesArePluggedInAndPulledOut) {
    FileSystem files;
    EXPECT_EQ(files.Devices(), std::vector<Text>{OLESTR("hd0a")});
    files.Plug(OLESTR("usb1"));
    ASSERT_EQ(files.Write(OLESTR("/usb1/f"), "x"), Result::Done);
    EXPECT_EQ(files.Devices(), (std::vector<Text>{OLESTR("hd0a"), OLESTR("usb1")}));
    files.Unplug(OLESTR("usb1"));
    EXPECT_FALSE(files.Exists(OLESTR("/usb1/f")));
    files.Plug(OLESTR("bad/name"));
    EXPECT_EQ(files.Devices().size(), 1u);
}

}  // namespace
}  // namespace tav::sim
