// How the documents, library modules, raw bodies and stylesheets that a query names are fetched:
// from where it is allowed, within which limits, and by whom.
//
// A compilation and a context each have such settings of their own. Without any they load files,
// http and https URLs, as a program does for its user; a host that runs the queries of strangers
// narrows that.
#pragma once

#include "xquery/Export.h"
#include "xquery/URL.h"

#include <chrono>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {

// Kinds of addresses that are no servers of the public network.
enum class XQueryAddressKind : uint8_t {
  Loopback,   // this machine: 127.0.0.0/8, ::1, and the unspecified address, which leads here too
  LinkLocal,  // neighbours: 169.254.0.0/16, fe80::/10; where clouds tell machines their secrets
  Private,    // 10.0.0.0/8, 172.16.0.0/12, 192.168.0.0/16, 100.64.0.0/10, fc00::/7 and the like
  Special,    // multicast, broadcast, reserved, for documentation
};

// Which URLs may be loaded. It is asked about every URL, of whatever purpose, before anything is
// fetched, and about the target of every redirect. Schemes are compared ignoring case. A redirect
// never leads from the network to a file, and a URL without a scheme is never loaded.
//
//   auto policy = XQueryLoadingPolicy::denyAll().allowFilesBelow("/srv/data").allowScheme("https");
//
// A program that fetches for strangers says which servers are meant, or which are not:
//
//   policy.allowHost("data.example.org").allowHost("*.example.com");
//   policy.forbidLocalAddresses();
class XQUERY_EXPORT XQueryLoadingPolicy {
 public:
  // Any file, http and https URL.
  [[nodiscard]] static XQueryLoadingPolicy allowAll();
  [[nodiscard]] static XQueryLoadingPolicy denyAll();

  // Any URL of that scheme. The library itself fetches file, http and https; another scheme is of
  // use to a loader of the host's own.
  XQueryLoadingPolicy& allowScheme(std::string_view scheme);
  // Files in that folder and in the folders under it. The folder must exist by now; one that does
  // not allows nothing.
  //
  // A path is judged by its text first, "." and ".." removed as RFC 3986 does it: it has to begin
  // with the folder as it is given here, or as it is without links. Of any other path nothing is
  // looked at, so that no answer tells what exists elsewhere. Links below the folder are followed
  // where they lead to a place below an allowed folder, and are refused otherwise.
  XQueryLoadingPolicy& allowFilesBelow(const std::string& folder);

  // What is at or below a URL on a server: its scheme, host and port, and the segments of its path.
  // "http://h/a" allows "http://h/a", "http://h/a?q" and "http://h/a/b", and not "http://h/ab";
  // "http://h/a/" does not allow "http://h/a". Compared are the two as RFC 3986 normalises them:
  // the case of scheme and host, a port that is the scheme's own, "." and ".." in the path, escapes
  // of letters and digits. Nothing is below a URL without a host, of the scheme file, with a user
  // name, a query or a fragment.
  //
  // Never allowed so is a URL with a user name, one whose host holds an escape, and one whose path
  // holds an escaped ".." or one with parameters ("..;x"), which servers read in different ways.
  // Schemes and hosts that are allowed, or not, do not matter; forbidden addresses do.
  XQueryLoadingPolicy& allowURLsBelow(std::string_view URL);

  // From the first call on, of URLs with a host only those of the hosts named, whatever the scheme
  // but file; their schemes have to be allowed as well. Names are compared ignoring case and as
  // the URL writes them: a name and an address are different hosts. Ports do not matter.
  // "*.example.org" stands for every name that ends in ".example.org".
  XQueryLoadingPolicy& allowHost(std::string_view name);
  // Nothing is fetched from a server whose address is of that kind, by whatever name: the address
  // counts that the library is about to connect to, so that names which change their meaning do
  // not matter, nor do redirects. No proxy is used from then on, since only it would know the
  // address. A loader of the host's own has to see to this by itself.
  XQueryLoadingPolicy& forbidAddresses(XQueryAddressKind kind);
  // Of every kind.
  XQueryLoadingPolicy& forbidLocalAddresses();

  // Whether a URL may be asked for. What it names may still be refused when it is opened or
  // connected to.
  bool allowsURL(const NSURL& URL) const;
  // Whether the place is in one of the folders; an absolute path without links and "..".
  bool isBelowAllowedFolder(std::string_view canonicalPath) const;
  bool allowsScheme(std::string_view scheme) const;
  bool allowsHost(std::string_view name) const;
  bool forbidsAddresses(XQueryAddressKind kind) const;

  // A path below one of the folders: the folder, without links, and the way from there on.
  struct Place {
    std::string folder;  // empty for the root, otherwise without a slash at the end
    std::string path;    // relative, as it is in the path asked about
  };
  // By the text of an absolute path without "." and ".."; nothing when it is below none.
  std::optional<Place> placeBelowFolder(std::string_view path) const;

 private:
  struct Folder {
    std::string spelling;  // as given; like `place` otherwise
    std::string place;     // canonical; the root is empty, the others without a slash
  };
  bool allowsHostOf(const NSURL& URL) const;
  bool isBelowAllowedURL(const NSURL& URL) const;

  std::vector<std::string> _schemes;  // in lower case
  std::vector<Folder> _folders;
  std::vector<std::string> _hosts;  // in lower case; any when there are none
  std::vector<std::string> _URLs;   // normalised
  uint8_t _forbiddenAddresses = 0;  // a bit for each kind
};

struct XQueryLoadingLimits {
  std::chrono::milliseconds connectTimeout{10'000};
  // For one resource, its redirects included.
  std::chrono::milliseconds totalTimeout{60'000};
  int mostRedirects = 5;
  // Of one resource, as it is fetched; of a document that is packed, the text as well.
  uint64_t mostBytes = uint64_t{256} << 20;
  // That one compilation may fetch. What lies beyond cannot be accessed (error 47).
  uint32_t mostModules = 10'000;
};

enum class XQueryLoadPurpose : uint8_t {
  Document,    // fn:doc
  Module,      // import module; UTF-8 text
  Body,        // ext:uri-body
  Stylesheet,  // ext:xslt-uri
};

// What was fetched.
struct XQueryResource {
  std::string data;
  // Without one, and with 0, 200 or 304, the data is used; with any other there is none.
  std::optional<int> statusCode;
  // "text/html", in any case and without parameters, makes the document an HTML one. Without, the
  // path of the URL decides: ".html" and ".htm".
  std::optional<std::string> MIMEType;
  // Where the redirects ended; information only.
  std::string URL;
};

// A host's own way to fetch, in place of the library's, for every purpose. It is called for the
// URLs that the policy allows. One loader given to several contexts must be safe to call from
// several threads.
//
// It is called on the thread that evaluates or compiles, unless that has limits: then it is called
// on a thread of its own, and that is waited for. A loader that does not answer in time is left
// behind: the evaluation ends as at any limit, and what the loader answers later is dropped. So it
// must not refer to anything that may be gone by then, such as the context; it itself is kept until
// it has answered. While more than a few calls are left behind the next one waits for its turn. An
// evaluation inside a loader that is called on a thread of its own has no limits but its own.
//
// What it throws passes through to the caller of the evaluation, as it was thrown: it is no failure
// to find the resource, and its std::bad_alloc is none of the engine's limits.
//
//   class Archive : public XQueryLoader {
//     std::optional<XQueryResource> load(const NSURL& URL, XQueryLoadPurpose) override {
//       const auto found = entries.find(URL.absoluteString()->utf8());
//       if (found == entries.end()) return std::nullopt;
//       return XQueryResource{found->second, {}, "application/xml", {}};
//     }
//   };
class XQUERY_EXPORT XQueryLoader {
 public:
  virtual ~XQueryLoader() = default;
  // Nothing when there is no such resource. Data longer than the limit counts as nothing.
  virtual std::optional<XQueryResource> load(const NSURL& URL, XQueryLoadPurpose purpose) = 0;
};

// All settings together.
//
//   XQueryLoading loading;
//   loading.policy = XQueryLoadingPolicy::denyAll();
//   loading.moduleURL = NSURL::fileURLWithPath("reports/sales.xq")->absoluteString()->utf8();
//   auto query = XQuery::xqueryWithSource(text, loading);
//   context->contextSetLoading(loading);
struct XQueryLoading {
  XQueryLoadingPolicy policy = XQueryLoadingPolicy::allowAll();
  XQueryLoadingLimits limits;
  std::shared_ptr<XQueryLoader> loader;  // null for the library's own
  // For a compilation: the absolute URL of the query's text, in UTF-8. The relative locations of
  // modules, documents and stylesheets that it names are resolved against it unless it declares a
  // base URI; it shows nowhere else. Empty for none. Library modules have their own.
  std::string moduleURL;
};

}  // namespace xquery
