#include "Types/XQueryValues.h"

#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryBinary.h"
#include "Types/XQueryDate.h"
#include "Types/XQueryDuration.h"
#include "Types/XQueryNodeFunctions.h"
#include "Types/XQueryNotation.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryQName.h"
#include "xquery/Collection.h"
#include "xquery/Error.h"
#include "xquery/URL.h"

#include <functional>

namespace xquery {

namespace {

// A host may hand in arrays within arrays; past this depth they print as "(...)".
constexpr int maximumDescriptionDepth = 16;

void describe(const NSObject* object, NSMutableString& text, int depth);

void describeSequence(const NSArray& sequence, NSMutableString& text, int depth) {
  text.append(u'(');
  if (depth == 0) {
    text.appendASCII("...");
  } else {
    for (size_t index = 0; index < sequence.count(); ++index) {
      checkWork();
      if (index > 0) text.appendASCII(", ");
      describe(sequence.objectAtIndex(index), text, depth - 1);
    }
  }
  text.append(u')');
}

void describe(const NSObject* object, NSMutableString& text, int depth) {
  if (!object) {
    text.appendASCII("(null)");
  } else if (const NSArray* sequence = dyn_cast<NSArray>(object)) {
    describeSequence(*sequence, text, depth);
  } else if (isa<NSNull>(object)) {
    text.appendASCII("()");
  } else if (object->isNode()) {
    text.append(XQueryNodeStringValue(cast<NSXMLNode>(object))->view());
  } else if (const NSError* error = dyn_cast<NSError>(object)) {
    text.append(error->description()->view());
  } else if (const NSData* data = dyn_cast<NSData>(object)) {
    text.appendASCII(XQueryHexEncode(data->bytes()));
  } else if (const Ref<NSString> value = XQueryStringValue(*object)) {
    text.append(value->view());
  }
}

}  // namespace

Ref<NSString> XQueryStringValue(const NSObject& object) {
  switch (object.kind()) {
    case Kind::String:
    case Kind::TypedString:
      return Ref<NSString>(const_cast<NSString*>(cast<NSString>(&object)));
    case Kind::Number:
    case Kind::DecimalNumber:
      return NSString::stringWithASCII(cast<NSNumber>(&object)->stringValue());
    case Kind::TypedNumber:
      return cast<XQueryNumber>(&object)->XQueryStringValue();
    case Kind::URL:
      return cast<NSURL>(&object)->absoluteString();
    case Kind::QName:
      return cast<XQueryQName>(&object)->XQueryStringValue();
    case Kind::Notation:
      return cast<XQueryNotation>(&object)->XQueryStringValue();
    case Kind::TypedDate:
      return cast<XQueryDate>(&object)->XQueryStringValue();
    case Kind::Duration:
      return cast<XQueryDuration>(&object)->XQueryStringValue();
    case Kind::HexBinary:
      return cast<XQueryHexBinary>(&object)->XQueryStringValue();
    case Kind::Base64Binary:
      return cast<XQueryBase64Binary>(&object)->XQueryStringValue();
    default:
      return nullptr;
  }
}

Ref<NSString> XQueryDescription(const NSObject* object) {
  NSMutableString text;
  describe(object, text, maximumDescriptionDepth);
  return text.string();
}

bool XQueryObjectsEqual(const NSObject& a, const NSObject& b) {
  if (&a == &b) return true;
  if (const NSString* text = dyn_cast<NSString>(&a)) {
    const NSString* other = dyn_cast<NSString>(&b);
    return other && text->isEqualToString(*other);
  }
  if (const NSNumber* number = dyn_cast<NSNumber>(&a)) {
    const NSNumber* other = dyn_cast<NSNumber>(&b);
    return other && number->isEqualToNumber(*other);
  }
  // Dates are equal as instants, whatever their types and zones.
  if (const NSDate* date = dyn_cast<NSDate>(&a)) {
    const NSDate* other = dyn_cast<NSDate>(&b);
    return other && date->isEqualToDate(*other);
  }
  if (a.kind() != b.kind()) return false;
  switch (a.kind()) {
    case Kind::URL:
      return cast<NSURL>(&a)->isEqual(*cast<NSURL>(&b));
    case Kind::QName:
      return cast<XQueryQName>(&a)->isEqual(*cast<XQueryQName>(&b));
    case Kind::Notation:
      return cast<XQueryNotation>(&a)->isEqual(*cast<XQueryNotation>(&b));
    case Kind::HexBinary:
    case Kind::Base64Binary:
      return cast<XQueryBinary>(&a)->isEqual(*cast<XQueryBinary>(&b));
    case Kind::Data:
      return cast<NSData>(&a)->isEqualToData(*cast<NSData>(&b));
    default:
      // Also of a general duration: it has no equality but being the same object.
      return false;
  }
}

uint32_t XQueryObjectHash(const NSObject& object) {
  switch (object.kind()) {
    case Kind::String:
    case Kind::TypedString:
      return cast<NSString>(&object)->hash();
    case Kind::Number:
    case Kind::DecimalNumber:
    case Kind::TypedNumber:
      return cast<NSNumber>(&object)->hash();
    case Kind::URL:
      return cast<NSURL>(&object)->hash();
    case Kind::QName:
      return cast<XQueryQName>(&object)->hash();
    case Kind::Notation:
      return cast<XQueryNotation>(&object)->hash();
    case Kind::HexBinary:
    case Kind::Base64Binary:
      return cast<XQueryBinary>(&object)->hash();
    case Kind::Date:
    case Kind::TypedDate:
      return cast<NSDate>(&object)->hash();
    case Kind::Data:
      return static_cast<uint32_t>(std::hash<std::string_view>()(cast<NSData>(&object)->bytes()));
    default:
      return static_cast<uint32_t>(std::hash<const void*>()(&object));
  }
}

}  // namespace xquery
