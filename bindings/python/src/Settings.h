// How queries are compiled and evaluated: limits, what may be loaded and by whom, who hears.
#pragma once

#include "Interrupts.h"
#include "Module.h"

#include <memory>

namespace xquery::python {

// xquery._xquery.Settings. Immutable. It keeps functions of Python, which may lead back to it, and
// so it takes part in the collection of cycles.
struct Settings : std::enable_shared_from_this<Settings> {
  XQueryLimits limits;    // its flag is not set
  XQueryLoading loading;  // its loader is not set
  std::map<std::string, std::string> namespaces;
  std::shared_ptr<Cancellation> cancellation;
  py::object loader, modules, trace, missing;  // None for none
  bool hasPlainPolicy = true;
  // Hears for these functions as long as the settings live.
  std::shared_ptr<XQueryClient> client;

  XQueryLimits limitsOf(const UnderWay& underWay) const;
  // Whether documents are loaded as a context does without being told.
  bool isLoadingPlain() const { return hasPlainPolicy && loader.is_none(); }
  // For a compilation, which may have a loader of modules of its own.
  XQueryLoading loadingOfModules() const;
  XQueryLoading loadingOfDocuments() const;
};

}  // namespace xquery::python
