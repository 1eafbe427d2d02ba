#include "Platform/Base/WorkMeter.h"
#include "xquery/Data.h"

namespace xquery {

NSData::NSData(std::string bytes) : NSCounted(Kind::Data), _bytes(std::move(bytes)) {
  countValueBlock(_bytes.size());
}

NSData::~NSData() {
  uncountValueBytes(_bytes.size());
}

}  // namespace xquery
