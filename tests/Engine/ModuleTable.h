// Library modules that a test writes down, given out to any number of threads.
#pragma once

#include "xquery/xquery.h"

#include <map>
#include <memory>
#include <optional>
#include <string>
#include <utility>

namespace xquery {

class ModuleTable : public XQueryLoader {
 public:
  using Texts = std::map<std::string, std::string>;  // by location

  explicit ModuleTable(Texts texts) : _texts(std::move(texts)) {}
  std::optional<XQueryResource> load(const NSURL& URL, XQueryLoadPurpose) override {
    const auto found = _texts.find(URL.absoluteString()->utf8());
    if (found == _texts.end()) return std::nullopt;
    return XQueryResource{found->second, {}, {}, {}};
  }

 private:
  const Texts _texts;
};

// Of nothing but these, at locations of any scheme.
inline XQueryLoading loadingOf(const ModuleTable::Texts& texts) {
  XQueryLoading loading;
  loading.loader = std::make_shared<ModuleTable>(texts);
  for (const auto& [location, text] : texts) {
    loading.policy.allowScheme(location.substr(0, location.find(':')));
  }
  return loading;
}

}  // namespace xquery
