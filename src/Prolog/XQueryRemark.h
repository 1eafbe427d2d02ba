// What the text of a module says that its expressions do not tell any more: the parser notes it for
// those who check queries.
#pragma once

#include "Platform/Base/XQueryPlaces.h"
#include "xquery/Object.h"
#include "xquery/String.h"

#include <cstdint>
#include <vector>

namespace xquery {

struct XQueryRemark {
  enum class Matter : uint8_t {
    EndTag,             // another name than that of the start tag
    EnclosedNamespace,  // a namespace declaration attribute with an expression in it
    LineEndReference,   // a character reference for a tab or a line end in an attribute
    TypeInTest,         // element(NAME, TYPE) and its kin
    SchemaTest,         // schema-element(NAME) and its kin
    Validate,
    SchemaImport,
    DefaultCollation,
    BaseURI,
  };
  Matter matter;
  int64_t line;  // counted from 0
  XQueryPlaceNumber place;
  Ref<NSString> first;  // the name or the URI that it is about; null for none
  Ref<NSString> second;
};

using XQueryRemarks = std::vector<XQueryRemark, ValueAllocator<XQueryRemark>>;

}  // namespace xquery
