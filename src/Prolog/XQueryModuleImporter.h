// Builds a prolog from where its items have been applied: its module imports are resolved, library
// modules that are not there yet being loaded and built in turn, and then its declarations are
// bound.
//
// A module is complete before the one that imports it goes on. Chains of imports may be long, so
// the modules at work are kept in a list and not on the stack.
#pragma once

#include "xquery/Error.h"
#include "xquery/Object.h"
#include "xquery/String.h"
#include "xquery/URL.h"

#include <cstddef>
#include <vector>

namespace xquery {

class XQueryProlog;

class XQueryModuleImporter {
 public:
  // What goes wrong is an error of the prolog that asked for the import. The first error of each
  // module that was there and did not do follows it.
  void build(const Ref<XQueryProlog>& prolog);

 private:
  // A prolog with its imports at work.
  struct Importer {
    Ref<XQueryProlog> prolog;
    size_t import = 0;
    size_t nextLocation = 0;
    std::vector<Ref<XQueryError>> reasons = {};  // why the locations tried did not do
  };

  void step();
  void resolve(Importer& importer);
  void tryLocation(Importer& importer, const Ref<NSString>& location);
  static void noteReasons(Importer& importer, const std::vector<Ref<XQueryError>>& errors,
                          const NSURL& URL);
  void finish();
  static void goOn(Importer& importer);

  std::vector<Importer> _importers;  // each imports the one after it
};

}  // namespace xquery
