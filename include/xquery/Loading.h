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

// Which URLs may be loaded. It is asked about every URL, of whatever purpose, before anything is
// fetched, and about the target of every redirect. Schemes are compared ignoring case. A redirect
// never leads from the network to a file, and a URL without a scheme is never loaded.
//
//   auto policy = XQueryLoadingPolicy::denyAll().allowFilesBelow("/srv/data").allowScheme("https");
class XQUERY_EXPORT XQueryLoadingPolicy {
 public:
  // Any file, http and https URL.
  [[nodiscard]] static XQueryLoadingPolicy allowAll();
  [[nodiscard]] static XQueryLoadingPolicy denyAll();

  // Any URL of that scheme. The library itself fetches file, http and https; another scheme is of
  // use to a loader of the host's own.
  XQueryLoadingPolicy& allowScheme(std::string_view scheme);
  // Files in that folder and in the folders under it, wherever their links and ".." lead: the place
  // of the file that is really opened counts. The folder must exist by now; one that does not
  // allows nothing.
  XQueryLoadingPolicy& allowFilesBelow(const std::string& folder);

  bool allowsURL(const NSURL& URL) const;
  // Whether the place is in one of the folders; an absolute path without links and "..".
  bool isBelowAllowedFolder(std::string_view canonicalPath) const;
  bool allowsScheme(std::string_view scheme) const;

 private:
  std::vector<std::string> _schemes;  // in lower case
  std::vector<std::string> _folders;  // canonical; the root is empty, the others without a slash
};

struct XQueryLoadingLimits {
  std::chrono::milliseconds connectTimeout{10'000};
  // For one resource, its redirects included.
  std::chrono::milliseconds totalTimeout{60'000};
  int mostRedirects = 5;
  // Of one resource.
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
// URLs that the policy allows and on the thread that evaluates or compiles; one loader given to
// several contexts must be safe to call from several threads. What it throws passes through.
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
