// Files below allowed folders, found with the kernel's help and without.
#include "Platform/Loading/FolderWalk.h"
#include "Platform/Loading/LoadingTestSupport.h"

#include <cerrno>
#include <cstring>
#include <sys/stat.h>

namespace xquery {
namespace {

using Find = Descriptor (*)(const XQueryLoadingPolicy&, const std::string&);

class FolderWalk : public testing::TestWithParam<Find> {
 protected:
  void SetUp() override {
    folder.write("data/a.xml", "a");
    folder.write("data/deep/er/b.xml", "b");
    folder.write("other/c.xml", "c");
    folder.write("secret/s.xml", "s");
    policy.allowFilesBelow(folder.path("data")).allowFilesBelow(folder.path("other"));
  }
  void link(const std::string& name, const std::string& target) {
    std::filesystem::create_symlink(target, folder.path(name));
  }
  // The file that is found, below the test's folder, or why there is none.
  std::string found(const std::string& name) {
    const Descriptor place = GetParam()(policy, folder.path(name));
    if (!place.isOpen()) return std::strerror(errno);
    const auto file =
        std::filesystem::read_symlink("/proc/self/fd/" + std::to_string(place.number()));
    return file.lexically_relative(folder.path()).string();
  }
  const std::string outside = std::strerror(EXDEV);

  TestFolder folder;
  XQueryLoadingPolicy policy = XQueryLoadingPolicy::denyAll();
};

INSTANTIATE_TEST_SUITE_P(Ways, FolderWalk,
                         testing::Values(findBelowAllowedFolders, walkBelowAllowedFolders),
                         [](const auto& way) { return way.index == 0 ? "Kernel" : "NameByName"; });

TEST_P(FolderWalk, FindsWhatIsBelowAFolder) {
  EXPECT_EQ(found("data/a.xml"), "data/a.xml");
  EXPECT_EQ(found("data/deep/er/b.xml"), "data/deep/er/b.xml");
  EXPECT_EQ(found("other/c.xml"), "other/c.xml");
  EXPECT_EQ(found("data/deep"), "data/deep");
  EXPECT_EQ(found("data/missing"), std::strerror(ENOENT));
  EXPECT_EQ(found("data/a.xml/x"), std::strerror(ENOTDIR));
  EXPECT_EQ(found("data/a.xml/"), std::strerror(ENOTDIR));
}

TEST_P(FolderWalk, LooksAtNothingElse) {
  EXPECT_EQ(found("secret/s.xml"), outside);
  EXPECT_EQ(found("missing/s.xml"), outside);
  EXPECT_EQ(found("data"), outside);
  EXPECT_EQ(found("data2/a.xml"), outside);
}

TEST_P(FolderWalk, FollowsLinksThatStayBelow) {
  link("data/near.xml", "a.xml");
  link("data/up.xml", "deep/er/../../a.xml");
  link("data/folder", "deep/er");
  link("data/deep/back", "..");
  link("data/absolute.xml", folder.path("data/a.xml"));
  link("data/whole", folder.path("data/deep"));
  EXPECT_EQ(found("data/near.xml"), "data/a.xml");
  EXPECT_EQ(found("data/up.xml"), "data/a.xml");
  EXPECT_EQ(found("data/folder/b.xml"), "data/deep/er/b.xml");
  EXPECT_EQ(found("data/deep/back/a.xml"), "data/a.xml");
  EXPECT_EQ(found("data/absolute.xml"), "data/a.xml");
  EXPECT_EQ(found("data/whole/er/b.xml"), "data/deep/er/b.xml");
}

TEST_P(FolderWalk, FollowsLinksFromOneFolderToAnother) {
  link("data/other", folder.path("other"));
  link("data/near", "../other");
  EXPECT_EQ(found("data/other/c.xml"), "other/c.xml");
  EXPECT_EQ(found("data/near/c.xml"), "other/c.xml");
}

TEST_P(FolderWalk, RefusesLinksThatLeadOutAlikeWhateverIsThere) {
  link("data/out.xml", "../secret/s.xml");
  link("data/nowhere.xml", "../secret/missing.xml");
  link("data/absolute", folder.path("secret"));
  link("data/root", "/");
  link("data/self", "/proc/self/root");
  for (const auto* name : {"data/out.xml", "data/nowhere.xml", "data/absolute/s.xml",
                           "data/absolute/missing", "data/root/etc/hosts", "data/self/etc/hosts"}) {
    EXPECT_EQ(found(name), outside) << name;
  }
}

TEST_P(FolderWalk, EndsWhereLinksLeadInCircles) {
  link("data/a", "b");
  link("data/b", "a");
  link("data/c", folder.path("data/c"));
  EXPECT_EQ(found("data/a"), std::strerror(ELOOP));
  EXPECT_EQ(found("data/c"), std::strerror(ELOOP));
}

TEST_P(FolderWalk, AFolderThatBecameALinkIsNoFolder) {
  std::filesystem::rename(folder.path("other"), folder.path("gone"));
  link("other", "secret");
  EXPECT_EQ(found("other/s.xml"), std::strerror(ENOTDIR));
}

}  // namespace
}  // namespace xquery
