#include "Platform/Loading/LoadingTestSupport.h"
#include "xquery/Loading.h"

namespace xquery {
namespace {

using Policy = XQueryLoadingPolicy;

bool allows(const Policy& policy, std::string_view URL) {
  return policy.allowsURL(*URLOf(URL));
}

TEST(LoadingPolicy, AtFirstFilesAndTheWebAreAllowed) {
  const Policy policy = XQueryLoading().policy;
  EXPECT_TRUE(allows(policy, "file:///etc/hosts"));
  EXPECT_TRUE(allows(policy, "http://example.org/"));
  EXPECT_TRUE(allows(policy, "https://example.org/"));
  EXPECT_FALSE(allows(policy, "ftp://example.org/"));
  EXPECT_FALSE(allows(policy, "gopher://example.org/"));
}

TEST(LoadingPolicy, DenyingAllAllowsNothing) {
  const Policy policy = Policy::denyAll();
  for (const auto* URL : {"file:///etc/hosts", "http://example.org/", "app:x", "", "a/b.xml"}) {
    EXPECT_FALSE(allows(policy, URL)) << URL;
  }
}

TEST(LoadingPolicy, AUrlWithoutASchemeIsNeverAllowed) {
  for (const auto* URL : {"", "a.xml", "/etc/hosts", "//example.org/a", "?q", "a/b:c"}) {
    EXPECT_FALSE(allows(Policy::allowAll(), URL)) << URL;
  }
}

TEST(LoadingPolicy, SchemesAreComparedIgnoringCase) {
  const Policy policy = Policy::denyAll().allowScheme("HTTPS");
  EXPECT_TRUE(allows(policy, "https://example.org/"));
  EXPECT_TRUE(allows(policy, "HttpS://example.org/"));
  EXPECT_FALSE(allows(policy, "http://example.org/"));
}

TEST(LoadingPolicy, AFolderAllowsWhatIsBelowIt) {
  TestFolder folder;
  const std::string inside = folder.write("data/deep/a.xml", "<a/>");
  const std::string beside = folder.write("data2/a.xml", "<a/>");
  const Policy policy = Policy::denyAll().allowFilesBelow(folder.path("data"));
  EXPECT_TRUE(allows(policy, inside));
  EXPECT_TRUE(allows(policy, folder.URL("data/not-there.xml")));
  EXPECT_FALSE(allows(policy, beside)) << "a folder whose name begins alike is another folder";
  EXPECT_FALSE(allows(policy, folder.URL("data"))) << "the folder itself is not below it";
  EXPECT_FALSE(allows(policy, "http://example.org" + inside.substr(inside.find("///") + 2)));
}

TEST(LoadingPolicy, TheRootFolderAllowsEveryFile) {
  const Policy policy = Policy::denyAll().allowFilesBelow("/");
  EXPECT_TRUE(allows(policy, "file:///etc/hosts"));
  EXPECT_FALSE(allows(policy, "http://example.org/"));
}

TEST(LoadingPolicy, DotsDoNotLeadOutOfAFolder) {
  TestFolder folder;
  folder.write("data/a.xml", "<a/>");
  folder.write("secret.xml", "<s/>");
  const Policy policy = Policy::denyAll().allowFilesBelow(folder.path("data"));
  for (const auto* way : {"data/../secret.xml", "data/%2e%2e/secret.xml", "data/..%2Fsecret.xml",
                          "data/x/../../secret.xml", "data//..//secret.xml"}) {
    EXPECT_FALSE(allows(policy, folder.URL(way))) << way;
  }
  EXPECT_TRUE(allows(policy, folder.URL("data/../data/a.xml")));
}

TEST(LoadingPolicy, LinksCountForWhereTheyLead) {
  TestFolder folder;
  folder.write("data/a.xml", "<a/>");
  folder.write("secret/s.xml", "<s/>");
  std::filesystem::create_symlink(folder.path("secret/s.xml"), folder.path("data/link.xml"));
  std::filesystem::create_symlink(folder.path("secret"), folder.path("data/folder"));
  std::filesystem::create_symlink(folder.path("data"), folder.path("way-in"));
  const Policy policy = Policy::denyAll().allowFilesBelow(folder.path("data"));
  EXPECT_FALSE(allows(policy, folder.URL("data/link.xml")));
  EXPECT_FALSE(allows(policy, folder.URL("data/folder/s.xml")));
  EXPECT_TRUE(allows(policy, folder.URL("way-in/a.xml")));
  // A link given as the folder stands for the folder that it leads to.
  const Policy linked = Policy::denyAll().allowFilesBelow(folder.path("way-in"));
  EXPECT_TRUE(allows(linked, folder.URL("data/a.xml")));
}

TEST(LoadingPolicy, AFolderThatIsNotThereAllowsNothing) {
  TestFolder folder;
  const Policy policy = Policy::denyAll().allowFilesBelow(folder.path("later"));
  const std::string URL = folder.write("later/a.xml", "<a/>");
  EXPECT_FALSE(allows(policy, URL));
  EXPECT_FALSE(allows(Policy::denyAll().allowFilesBelow(""), URL));
}

TEST(LoadingPolicy, SeveralFoldersAndSchemesAddUp) {
  TestFolder folder;
  const std::string a = folder.write("a/a.xml", ""), b = folder.write("b/b.xml", ""),
                    c = folder.write("c/c.xml", "");
  const Policy policy = Policy::denyAll()
                            .allowFilesBelow(folder.path("a"))
                            .allowFilesBelow(folder.path("b"))
                            .allowScheme("app");
  EXPECT_TRUE(allows(policy, a));
  EXPECT_TRUE(allows(policy, b));
  EXPECT_FALSE(allows(policy, c));
  EXPECT_TRUE(allows(policy, "app:anything"));
}

}  // namespace
}  // namespace xquery
