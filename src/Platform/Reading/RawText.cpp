#include "Platform/Reading/RawText.h"

namespace xquery {

ReadText RawTexts::replaced(const ReadText& known, Append append) {
  _scratch.clear();
  append(known.bytes, _scratch);
  return ReadText(_scratch);
}

}  // namespace xquery
