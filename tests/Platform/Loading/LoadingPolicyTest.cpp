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
                          "data/x/../../secret.xml", "data//..//secret.xml", "data/.%2e/secret.xml",
                          "data/../../../../../../secret.xml"}) {
    EXPECT_FALSE(allows(policy, folder.URL(way))) << way;
  }
  EXPECT_TRUE(allows(policy, folder.URL("data/../data/a.xml")));
}

TEST(LoadingPolicy, LinksBelowAFolderCountForWhereTheyLead) {
  TestFolder folder;
  folder.write("data/a.xml", "<a/>");
  folder.write("secret/s.xml", "<s/>");
  std::filesystem::create_symlink(folder.path("secret/s.xml"), folder.path("data/link.xml"));
  std::filesystem::create_symlink(folder.path("secret"), folder.path("data/folder"));
  std::filesystem::create_symlink(folder.path("data/a.xml"), folder.path("data/fine.xml"));
  const Policy policy = Policy::denyAll().allowFilesBelow(folder.path("data"));
  EXPECT_FALSE(allows(policy, folder.URL("data/link.xml")));
  EXPECT_FALSE(allows(policy, folder.URL("data/folder/s.xml")));
  EXPECT_TRUE(allows(policy, folder.URL("data/fine.xml")));
}

TEST(LoadingPolicy, AFolderGivenByALinkIsKnownByBothNames) {
  TestFolder folder;
  folder.write("data/a.xml", "<a/>");
  std::filesystem::create_symlink(folder.path("data"), folder.path("way-in"));
  const Policy linked = Policy::denyAll().allowFilesBelow(folder.path("way-in"));
  EXPECT_TRUE(allows(linked, folder.URL("way-in/a.xml")));
  EXPECT_TRUE(allows(linked, folder.URL("data/a.xml")));
  // Otherwise a link from elsewhere is elsewhere, so that nothing tells what is there.
  const Policy policy = Policy::denyAll().allowFilesBelow(folder.path("data"));
  EXPECT_FALSE(allows(policy, folder.URL("way-in/a.xml")));
}

// Whether the way there exists must not show.
TEST(LoadingPolicy, ThePathCountsByItsTextWhateverExistsElsewhere) {
  TestFolder folder;
  folder.write("data/a.xml", "<a/>");
  folder.write("there/x", "");
  const Policy policy = Policy::denyAll().allowFilesBelow(folder.path("data"));
  for (const std::string way : {"there/..", "missing/..", "there/x/../..", "missing/x/../..",
                                "there/x/%2E%2e/..", "missing/x/%2e./.."}) {
    EXPECT_TRUE(allows(policy, folder.URL(way + "/data/a.xml"))) << way;
    EXPECT_FALSE(allows(policy, folder.URL(way + "/there/x"))) << way;
  }
  EXPECT_TRUE(allows(policy, "file:///proc/1/../.." + folder.path("data/a.xml")));
  EXPECT_TRUE(allows(policy, "file:///proc/0/../.." + folder.path("data/a.xml")));
}

// --- hosts ---------------------------------------------------------------------------------------

TEST(LoadingPolicy, AnyHostIsAllowedUntilOneIsNamed) {
  Policy policy = Policy::allowAll();
  EXPECT_TRUE(allows(policy, "http://example.org/"));
  policy.allowHost("Data.Example.org").allowHost("*.example.com").allowHost("[::1]");
  for (const auto* URL :
       {"http://data.example.org/", "https://DATA.example.org:8080/a",
        "http://user@data.example.org", "http://data.example.org./", "http://a.example.com/",
        "http://a.b.example.com/", "http://[::1]:80/", "file:///etc/hosts"}) {
    EXPECT_TRUE(allows(policy, URL)) << URL;
  }
  for (const auto* URL :
       {"http://example.org/", "http://a.data.example.org/", "http://example.com/",
        "http://badexample.com/", "http://data.example.org.evil.net/", "http://127.0.0.1/",
        "http://data.example.org@evil.net/", "http:///data.example.org/", "http:data.example.org",
        "http://%64ata.example.org/"}) {
    EXPECT_FALSE(allows(policy, URL)) << URL;
  }
}

TEST(LoadingPolicy, HostsComeOnTopOfSchemes) {
  const Policy policy = Policy::denyAll().allowScheme("https").allowHost("h").allowScheme("app");
  EXPECT_TRUE(allows(policy, "https://h/"));
  EXPECT_FALSE(allows(policy, "http://h/"));
  EXPECT_TRUE(allows(policy, "app:anything")) << "a URL without a host";
  EXPECT_FALSE(allows(policy, "app://elsewhere/"));
}

// --- URLs ----------------------------------------------------------------------------------------

TEST(LoadingPolicy, AUrlAllowsWhatIsAtItAndBelow) {
  const Policy policy =
      Policy::denyAll().allowURLsBelow("http://a.b/data").allowURLsBelow("https://c:8443/x/");
  for (const auto* URL : {"http://a.b/data", "http://a.b/data/", "http://a.b/data/d.xml?q=1#f",
                          "http://a.b/data?q", "https://c:8443/x/", "https://c:8443/x/y/z",
                          "http://a.b/data/%2Fx", "http://a.b/data/a;b"}) {
    EXPECT_TRUE(allows(policy, URL)) << URL;
  }
  for (const auto* URL :
       {"http://a.b/", "http://a.b/database", "http://a.b", "https://c:8443/x", "https://c/x/y",
        "https://a.b/data", "http://a.b:8080/data/", "http://a.b.evil/data", "http://evil/data",
        "http://a.b@evil/data", "http://evil/http://a.b/data", "http:a.b/data", "/data", "data"}) {
    EXPECT_FALSE(allows(policy, URL)) << URL;
  }
}

TEST(LoadingPolicy, AServerEndsWhereItsNameEnds) {
  for (const auto* server : {"http://a.b", "http://a.b/", "http://A.B.:80/"}) {
    const Policy policy = Policy::denyAll().allowURLsBelow(server);
    EXPECT_TRUE(allows(policy, "http://a.b")) << server;
    EXPECT_TRUE(allows(policy, "http://a.b/x/y")) << server;
    EXPECT_FALSE(allows(policy, "http://a.b.evil/")) << server;
    EXPECT_FALSE(allows(policy, "http://a.bevil/")) << server;
    EXPECT_FALSE(allows(policy, "http://a.b:81/")) << server;
  }
  EXPECT_TRUE(allows(Policy::denyAll().allowURLsBelow("http://[::1]:81/"), "http://[::1]:81/x"));
  EXPECT_FALSE(allows(Policy::denyAll().allowURLsBelow("http://[::1]:81/"), "http://[::1]/x"));
}

TEST(LoadingPolicy, UrlsAreComparedAsTheyAreNormalised) {
  const Policy policy = Policy::denyAll().allowURLsBelow("HTTP://A.b:80/x/../D%61ta/%7e/%c3%a4/");
  for (const auto* URL : {"http://a.b/Data/~/%C3%A4/f", "hTTp://a.B:080/D%61ta/%7E/%c3%A4/",
                          "http://a.b:/Data/./~/y/../%c3%a4/f", "http://a.b./Data/%7e/%C3%A4/f"}) {
    EXPECT_TRUE(allows(policy, URL)) << URL;
  }
  EXPECT_FALSE(allows(policy, "http://a.b/data/~/%C3%A4/f")) << "the case of a path matters";
  const Policy escaped = Policy::denyAll().allowURLsBelow("http://a.b/a%2Fb/");
  EXPECT_TRUE(allows(escaped, "http://a.b/a%2fb/c"));
  EXPECT_FALSE(allows(escaped, "http://a.b/a/b/c")) << "an escaped slash is no slash";
}

TEST(LoadingPolicy, DotsDoNotLeadOutOfAUrl) {
  const Policy policy = Policy::denyAll().allowURLsBelow("http://h/d/");
  for (const auto* URL :
       {"http://h/d/../s", "http://h/d/%2e%2e/s", "http://h/d/.%2E/s", "http://h/d/..%2Fs",
        "http://h/d/%2e%2e%2fs", "http://h/d/..%5Cs", "http://h/d/x%2f..%2f..%2fs",
        "http://h/d/..;x/s", "http://h/d/%2e%2e;/s", "http://h/d/.."}) {
    EXPECT_FALSE(allows(policy, URL)) << URL;
  }
  EXPECT_TRUE(allows(policy, "http://h/d/x/../s"));
  EXPECT_TRUE(allows(policy, "http://h/d/...")) << "a name";
}

TEST(LoadingPolicy, WhatTwoProgramsReadDifferentlyIsBelowNoUrl) {
  const Policy policy = Policy::denyAll().allowURLsBelow("http://h/");
  for (const auto* URL : {"http://user@h/", "http://@h/", "http://h%2eevil/", "http://%68/",
                          "http://h:99999/", "http:///h/", "http://:80/"}) {
    EXPECT_FALSE(allows(policy, URL)) << URL;
  }
}

TEST(LoadingPolicy, WhatIsNoServersUrlAllowsNothing) {
  for (const auto* URL : {"", "h", "/d/", "http:", "http://", "http://u@h/", "http://h/?q",
                          "http://h/#f", "file:///", "file://h/", "http://h/ x", "http://h:x/"}) {
    const Policy policy = Policy::denyAll().allowURLsBelow(URL);
    EXPECT_FALSE(allows(policy, "http://h/")) << URL;
    EXPECT_FALSE(allows(policy, "file:///etc/hosts")) << URL;
  }
}

TEST(LoadingPolicy, AUrlIsAllowedBesideSchemesAndHosts) {
  Policy policy = Policy::denyAll().allowScheme("https").allowHost("h");
  policy.allowURLsBelow("http://other/x/").allowURLsBelow("app://archive/");
  EXPECT_TRUE(allows(policy, "https://h/"));
  EXPECT_TRUE(allows(policy, "http://other/x/y"));
  EXPECT_TRUE(allows(policy, "app://archive/d.xml"));
  EXPECT_FALSE(allows(policy, "https://other/x/y"));
  EXPECT_FALSE(allows(policy, "http://h/"));
}

TEST(LoadingPolicy, AddressesAreForbiddenByKind) {
  Policy policy = Policy::allowAll();
  EXPECT_FALSE(policy.forbidsAddresses(XQueryAddressKind::Private));
  policy.forbidAddresses(XQueryAddressKind::LinkLocal);
  EXPECT_TRUE(policy.forbidsAddresses(XQueryAddressKind::LinkLocal));
  EXPECT_FALSE(policy.forbidsAddresses(XQueryAddressKind::Private));
  policy.forbidLocalAddresses();
  for (const auto kind : {XQueryAddressKind::Loopback, XQueryAddressKind::LinkLocal,
                          XQueryAddressKind::Private, XQueryAddressKind::Special}) {
    EXPECT_TRUE(policy.forbidsAddresses(kind));
  }
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
