// The exported profile: the counts of contexts, added up.
#include "Context/XQueryContextInternal.h"
#include "Engine/XQueryInternal.h"
#include "Plan/Profile/ProfileWriters.h"
#include "xquery/Profile.h"
#include "xquery/XQuery.h"

namespace xquery {

XQueryProfile::XQueryProfile(const XQuery& query) {
  const auto& program = _internal(query).profiledProgram();
  const XQueryProfileCounts none(program ? program->counted.size() : 0);
  _data = std::make_unique<XQueryProfileData>(XQueryProfileData{program, none});
}

XQueryProfile::~XQueryProfile() = default;
XQueryProfile::XQueryProfile(XQueryProfile&& other) noexcept = default;
XQueryProfile& XQueryProfile::operator=(XQueryProfile&& other) noexcept = default;

bool XQueryProfile::add(const XQueryContext& context) {
  const XQueryProfileRecorder* recorder = _internal(context).profile();
  if (!recorder || !_data->program || recorder->program() != _data->program) return false;
  _data->counts.add(recorder->counts());
  return true;
}

uint64_t XQueryProfile::evaluations() const {
  return _data->counts.evaluations();
}

std::string XQueryProfile::describe(XQueryProfileFormat format,
                                    const XQueryProfileSurroundings& surroundings) const {
  if (!_data->program) return {};
  switch (format) {
    case XQueryProfileFormat::JSON:
      return XQueryProfileJSON(*_data, surroundings);
    case XQueryProfileFormat::HTML:
      return XQueryProfilePage(*_data, surroundings);
    case XQueryProfileFormat::Text:
      break;
  }
  return XQueryProfileText(*_data, surroundings);
}

}  // namespace xquery
