// Questions that every atomic value answers, whichever class it has.
#pragma once

#include "Types/XQueryTypeTable.h"
#include "xquery/Object.h"
#include "xquery/String.h"

namespace xquery {

// The canonical lexical form. Null for an object that is no atomic value.
Ref<NSString> XQueryStringValue(const NSObject& object);
// How "%@" prints an object in a message: the string value; a sequence as its items in parentheses
// separated by ", "; a missing object as "(null)".
Ref<NSString> XQueryDescription(const NSObject* object);
// Value equality between atomic values of one class family, and the hash that agrees with it.
bool XQueryObjectsEqual(const NSObject& a, const NSObject& b);
uint32_t XQueryObjectHash(const NSObject& object);

}  // namespace xquery
