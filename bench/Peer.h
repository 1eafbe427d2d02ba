// The peer that the engine is measured against: the XML library's own tree and XPath.
#pragma once

#include <cstddef>
#include <memory>
#include <string>

namespace bench {

class PeerDocument {
 public:
  // The text must be well formed; white space is kept.
  explicit PeerDocument(const std::string& xml);
  ~PeerDocument();
  PeerDocument(const PeerDocument&) = delete;
  PeerDocument& operator=(const PeerDocument&) = delete;

 private:
  struct Impl;
  std::unique_ptr<Impl> _impl;
  friend class PeerQuery;
};

class PeerQuery {
 public:
  explicit PeerQuery(const std::string& xpath);
  ~PeerQuery();
  PeerQuery(const PeerQuery&) = delete;
  PeerQuery& operator=(const PeerQuery&) = delete;

  // The number of nodes selected.
  size_t evaluate(const PeerDocument& document) const;

 private:
  struct Impl;
  std::unique_ptr<Impl> _impl;
};

}  // namespace bench
