// Profiles of queries that were compiled for it.
#include "C/Contexts.h"
#include "C/Queries.h"
#include "C/Texts.h"
#include "xquery/capi/profile.h"
#include "xquery/Profile.h"

using namespace xquery;
using namespace xquery::capi;

struct xq_profile : Handle<Tag::Profile> {
  explicit xq_profile(Ref<XQuery> ofQuery) : query(std::move(ofQuery)), profile(*query) {}

  const Ref<XQuery> query;
  XQueryProfile profile;
};

xq_status xq_profile_new(const xq_query* query, xq_profile** profile) {
  if (!profile) return XQ_USAGE;
  *profile = nullptr;
  if (!areGood(query)) return XQ_USAGE;
  if (query->way != XQueryWay::Profiled) return XQ_MISMATCH;
  return guarded([&] { return giveNew(profile, query->query); });
}

xq_status xq_profile_free(xq_profile* profile) {
  return freeHandle(profile);
}

xq_status xq_profile_add(xq_profile* profile, const xq_context* context) {
  if (!areGood(profile)) return XQ_USAGE;
  const ContextUse use(context);
  if (!use) return XQ_USAGE;
  return guarded([&] { return profile->profile.add(*context->context) ? XQ_OK : XQ_MISMATCH; });
}

xq_status xq_profile_evaluations(const xq_profile* profile, uint64_t* count) {
  if (!count) return XQ_USAGE;
  *count = 0;
  if (!areGood(profile)) return XQ_USAGE;
  *count = profile->profile.evaluations();
  return XQ_OK;
}

static_assert(XQ_PROFILE_JSON == static_cast<int>(XQueryProfileFormat::JSON));
static_assert(XQ_PROFILE_TEXT == static_cast<int>(XQueryProfileFormat::Text));
static_assert(XQ_PROFILE_HTML == static_cast<int>(XQueryProfileFormat::HTML));

xq_status xq_profile_describe(const xq_profile* profile, xq_profile_format format, const char* name,
                              size_t length, xq_text* text) {
  const GivenText given(name, length);
  if (!emptied(text) || !areGood(profile) || !given.isGood()) return XQ_USAGE;
  if (format < XQ_PROFILE_JSON || format > XQ_PROFILE_HTML) return XQ_USAGE;
  return guarded([&]() -> xq_status {
    if (!given.string()) return XQ_INPUT;
    XQueryProfileSurroundings surroundings;
    surroundings.name = given.view();
    return fill(*text,
                profile->profile.describe(static_cast<XQueryProfileFormat>(format), surroundings));
  });
}
