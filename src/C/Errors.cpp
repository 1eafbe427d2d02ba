// Errors as the host sees them.
#include "C/Errors.h"

#include "C/Texts.h"

using namespace xquery;
using namespace xquery::capi;

namespace {

std::string textOf(const Ref<NSString>& string) {
  return string ? string->utf8() : std::string();
}

PlaceTexts textsOf(const XQuerySourcePlace& place) {
  return {textOf(place.moduleURL), place.line, place.column, place.length,
          textOf(place.sourceLine)};
}

CallTexts textsOf(const XQueryErrorCall& call) {
  CallTexts texts = {textOf(call.function), std::nullopt};
  if (call.place) texts.place = textsOf(*call.place);
  return texts;
}

xq_place borrowedPlace(const PlaceTexts& place) {
  return {borrowed(place.moduleURL), place.line, place.column, place.length,
          borrowed(place.sourceLine)};
}

constexpr xq_place noPlace = {{"", 0}, 0, 0, 0, {"", 0}};

static_assert(XQ_CATEGORY_SYNTAX == static_cast<int>(XQueryErrorCategory::Syntax));
static_assert(XQ_CATEGORY_NAMES == static_cast<int>(XQueryErrorCategory::Names));
static_assert(XQ_CATEGORY_TYPES == static_cast<int>(XQueryErrorCategory::Types));
static_assert(XQ_CATEGORY_VALUES == static_cast<int>(XQueryErrorCategory::Values));
static_assert(XQ_CATEGORY_LOADING == static_cast<int>(XQueryErrorCategory::Loading));
static_assert(XQ_CATEGORY_LIMIT == static_cast<int>(XQueryErrorCategory::Limit));
static_assert(XQ_CATEGORY_RAISED_BY_QUERY == static_cast<int>(XQueryErrorCategory::RaisedByQuery));
static_assert(XQ_CATEGORY_INTERNAL == static_cast<int>(XQueryErrorCategory::Internal));

}  // namespace

xq_error::xq_error(Ref<NSArray> inList, size_t atIndex) : list(std::move(inList)), index(atIndex) {
  const auto& error = *cast<NSError>(list->objectAtIndex(atIndex));
  number = error.code();
  description = textOf(error.description());
  const auto* raised = dyn_cast<XQueryError>(&error);
  if (!raised) {
    if (error.userInfo()) message = textOf(error.userInfo()->errorMessage);
    return;
  }
  category = static_cast<xq_category>(raised->category());
  message = textOf(raised->msg());
  line = raised->line();
  column = raised->column();
  if (const auto known = raised->place()) place = textsOf(*known);
  for (const XQueryErrorCall& call : raised->calls()) calls.push_back(textsOf(call));
  callsLeftOut = raised->callsLeftOut();
}

xq_error::xq_error(const NSXMLParseError& error)
    : category(XQ_CATEGORY_INPUT),
      line(error.line),
      column(error.column),
      message(error.message),
      description(error.message) {
  if (line == 0) return;
  description =
      "line " + std::to_string(line) + ", column " + std::to_string(column) + ": " + description;
}

namespace xquery::capi {

xq_status giveErrors(xq_error** out, const Ref<NSArray>& errors) {
  if (out) giveNew(out, errors, size_t{0});
  return XQ_ERROR;
}

xq_status giveError(xq_error** out, const Ref<NSError>& error) {
  if (out) giveNew(out, NSArray::arrayWithObjects({error}), size_t{0});
  return XQ_ERROR;
}

xq_status giveError(xq_error** out, const NSXMLParseError& error) {
  if (out) giveNew(out, error);
  return XQ_INPUT;
}

xq_status giveOuterLimit(xq_error** out, const NSException& limit) {
  const std::string reason = limit.reason() ? limit.reason()->utf8() : std::string();
  return giveError(out, XQueryError::error(XQueryErrorCategory::Limit, 0,
                                           NSString::stringWithUTF8Replacing(reason)));
}

}  // namespace xquery::capi

namespace {

// What one of the accessors of errors answers.
template <class Out, class Read>
xq_status readError(const xq_error* error, Out* out, Out otherwise, Read read) {
  if (!out) return XQ_USAGE;
  *out = otherwise;
  return areGood(error) ? read() : XQ_USAGE;
}

}  // namespace

xq_status xq_error_number(const xq_error* error, int64_t* number) {
  return readError(error, number, int64_t{0}, [&] {
    *number = error->number;
    return XQ_OK;
  });
}

xq_status xq_error_category(const xq_error* error, xq_category* category) {
  return readError(error, category, xq_category{0}, [&] {
    *category = error->category;
    return XQ_OK;
  });
}

xq_status xq_error_message(const xq_error* error, xq_string* message) {
  return readError(error, message, xq_string{"", 0}, [&] {
    *message = borrowed(error->message);
    return XQ_OK;
  });
}

xq_status xq_error_description(const xq_error* error, xq_string* description) {
  return readError(error, description, xq_string{"", 0}, [&] {
    *description = borrowed(error->description);
    return XQ_OK;
  });
}

xq_status xq_error_line(const xq_error* error, int64_t* line, int64_t* column) {
  if (!line || !column) return XQ_USAGE;
  *line = *column = 0;
  if (!areGood(error)) return XQ_USAGE;
  *line = error->line;
  *column = error->column;
  return error->line ? XQ_OK : XQ_END;
}

xq_status xq_error_place(const xq_error* error, xq_place* place) {
  return readError(error, place, noPlace, [&] {
    if (!error->place) return XQ_END;
    *place = borrowedPlace(*error->place);
    return XQ_OK;
  });
}

xq_status xq_error_call(const xq_error* error, size_t index, xq_call* call) {
  return readError(error, call, xq_call{{"", 0}, 0, noPlace}, [&] {
    if (index >= error->calls.size()) return XQ_END;
    const CallTexts& texts = error->calls[index];
    call->function = borrowed(texts.function);
    call->has_place = texts.place.has_value();
    if (texts.place) call->place = borrowedPlace(*texts.place);
    return XQ_OK;
  });
}

xq_status xq_error_calls_left_out(const xq_error* error, int64_t* count) {
  return readError(error, count, int64_t{0}, [&] {
    *count = error->callsLeftOut;
    return XQ_OK;
  });
}

xq_status xq_error_next(const xq_error* error, xq_error** next) {
  return readError(error, next, static_cast<xq_error*>(nullptr), [&] {
    if (!error->list || error->index + 1 >= error->list->count()) return xq_status{XQ_END};
    return guarded([&] { return giveNew(next, error->list, error->index + 1); });
  });
}

xq_status xq_error_free(xq_error* error) {
  return freeHandle(error);
}
