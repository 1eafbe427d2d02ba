// Builds a prolog from where its items have been applied: its module imports are resolved, library
// modules that are not there yet being loaded and built in turn, and then its declarations are
// bound.
//
// A module is complete before the one that imports it goes on. Chains of imports may be long, so
// the modules at work are kept in a list and not on the stack. The process-wide lock of the parser
// is taken for each module's text alone, never while something is fetched.
#pragma once

#include "xquery/Object.h"
#include "xquery/String.h"

#include <cstddef>
#include <vector>

namespace xquery {

class XQueryProlog;

class XQueryModuleImporter {
 public:
  // What goes wrong is an error of the prolog that asked for the import; what was wrong with a
  // module that did not do is forgotten.
  void build(const Ref<XQueryProlog>& prolog);

 private:
  // A prolog with its imports at work.
  struct Importer {
    Ref<XQueryProlog> prolog;
    size_t import = 0;
    size_t nextLocation = 0;
  };

  void step();
  void resolve(Importer& importer);
  void tryLocation(XQueryProlog& importer, const Ref<NSString>& location);
  void finish();
  static void goOn(Importer& importer);

  std::vector<Importer> _importers;  // each imports the one after it
};

}  // namespace xquery
