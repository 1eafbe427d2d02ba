// The C interface by sequences of calls. Each byte of the input chooses a function, those behind it
// its arguments: handles out of a few places for each kind, some of them empty, now and then one of
// another kind; numbers; pieces of text. Whatever is called in whatever order, the answer is a
// status, and what a function answers besides it is what the interface promises.
//
// Handles are not used after they were freed, nor freed twice, which nobody promises anything of.
// Nothing is read from files or the network.
#include "xquery/capi.h"

#include <array>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <string_view>
#include <tuple>
#include <type_traits>

namespace {

[[noreturn]] void fail(const char* what) {
  std::fprintf(stderr, "%s\n", what);
  std::abort();
}

class Input {
 public:
  Input(const uint8_t* data, size_t size) : _at(data), _end(data + size) {}

  bool isOver() const { return _at == _end; }
  uint8_t byte() { return isOver() ? 0 : *_at++; }
  // At times one that is none of a family.
  int number(int count) { return byte() % (count + 1) - (_at != _end && *_at == 255 ? 1 : 0); }
  int64_t wide() {
    int64_t value = 0;
    for (int i = 0; i < 8; ++i)
      value = static_cast<int64_t>(static_cast<uint64_t>(value) << 8 | byte());
    return value;
  }
  // Up to a line feed, which is left out.
  std::string_view line() {
    const uint8_t* start = _at;
    while (_at != _end && *_at != '\n') ++_at;
    const auto length = static_cast<size_t>(_at - start);
    if (_at != _end) ++_at;
    return {reinterpret_cast<const char*>(start), length};
  }

 private:
  const uint8_t* _at;
  const uint8_t* const _end;
};

constexpr size_t placesOfKind = 4;

template <class H>
using Places = std::array<H*, placesOfKind>;

// One of each kind, to be given where another kind is asked for. They are never freed: a call may
// free what is in a place before it uses what it was given.
struct Strays {
  xq_query* query = nullptr;
  xq_context* context = nullptr;
  xq_value* value = nullptr;
  xq_node* node = nullptr;
  xq_options* options = nullptr;
  xq_error* error = nullptr;

  Strays() {
    xq_query* none = nullptr;
    const bool areMade = xq_compile("1", 1, nullptr, &query, nullptr) == XQ_OK &&
                         xq_context_new(&context) == XQ_OK && xq_value_new(&value) == XQ_OK &&
                         xq_read_memory("<a/>", 4, 0, &node, nullptr) == XQ_OK &&
                         xq_options_new(&options) == XQ_OK &&
                         xq_compile("1 +", 3, nullptr, &none, &error) == XQ_ERROR;
    if (!areMade) fail("a handle cannot be made");
  }
};

class Session {
 public:
  explicit Session(Input& input) : _input(input) {}
  ~Session();
  void call();

 private:
  template <class H>
  H*& place(Places<H>& places) {
    return places[_input.byte() % placesOfKind];
  }
  // A handle to be used: one of the places, or one of another kind as if it were of this one.
  template <class H>
  H* used(Places<H>& places) {
    const uint8_t which = _input.byte();
    if (which < 250) return places[which % placesOfKind];
    static const Strays strays;
    const std::tuple others = {strays.query, strays.context, strays.value,
                               strays.node,  strays.options, strays.error};
    // One of its own kind would be used, and changed, by one input after the other.
    const auto asThis = [](auto* other) {
      return std::is_same_v<decltype(other), H*> ? nullptr : static_cast<void*>(other);
    };
    void* const given = std::apply(
        [&](auto*... other) {
          return std::array<void*, sizeof...(other)>{asThis(other)...}[which - 250];
        },
        others);
    return static_cast<H*>(given);
  }
  // Frees what is in a place, to put another handle there.
  template <class H>
  H** emptied(Places<H>& places, xq_status (*free)(H*)) {
    H*& found = place(places);
    expectSuccess(free(found));
    found = nullptr;
    return &found;
  }
  static void expectSuccess(xq_status status) {
    if (status != XQ_OK) fail("a handle that is in use cannot be freed");
  }
  // A handle is there exactly when the status says so.
  template <class H>
  void expectHandle(xq_status status, H** handle) {
    expectStatus(status);
    if ((status == XQ_OK) != (*handle != nullptr)) fail("a handle does not go with its status");
  }
  static void expectStatus(xq_status status) {
    if (status < XQ_OK || status > XQ_HOST) fail("a status that must not be");
  }
  void expectText(xq_status status) {
    expectStatus(status);
    if (!_text.data || _text.data[_text.length] != 0) fail("a text that does not end");
    if (status != XQ_OK && _text.length != 0) fail("a text after a failure");
  }
  xq_error** anError() { return emptied(_errors, xq_error_free); }

  void callOptions();
  void callReading();
  void callNode();
  void callNodeText();
  void callMaking();
  void callMakingMore();
  void callItem();
  void callItemMore();
  void callQuery();
  void callContext();
  void callEvaluation();
  void callError();
  void callProfile();

  static ptrdiff_t read(void* session, char* buffer, size_t size);
  static int write(void* session, const char*, size_t) {
    return static_cast<Session*>(session)->_input.byte() == 7;
  }
  static int trace(void* session, const xq_value* value, const char*, size_t);
  static int missing(void* session, const char*, size_t, const char*, size_t) {
    return static_cast<Session*>(session)->_input.byte() == 7;
  }
  static xq_status receive(void* session, const xq_value* item);
  static xq_status load(void* session, const char* url, size_t, xq_purpose, xq_resource* resource);

  Input& _input;
  Places<xq_query> _queries = {};
  Places<xq_context> _contexts = {};
  Places<xq_value> _values = {};
  Places<xq_node> _nodes = {};
  Places<xq_options> _options = {};
  Places<xq_cancel> _cancels = {};
  Places<xq_error> _errors = {};
  Places<xq_profile> _profiles = {};
  xq_text _text = XQ_TEXT_INIT;
  xq_text _second = XQ_TEXT_INIT;
  xq_text _third = XQ_TEXT_INIT;
  xq_context* _running = nullptr;
};

Session::~Session() {
  for (xq_profile* profile : _profiles) expectSuccess(xq_profile_free(profile));
  for (xq_value* value : _values) expectSuccess(xq_value_free(value));
  for (xq_node* node : _nodes) expectSuccess(xq_node_free(node));
  for (xq_error* error : _errors) expectSuccess(xq_error_free(error));
  for (xq_query* query : _queries) expectSuccess(xq_query_free(query));
  for (xq_context* context : _contexts) expectSuccess(xq_context_free(context));
  for (xq_options* options : _options) expectSuccess(xq_options_free(options));
  for (xq_cancel* cancel : _cancels) expectSuccess(xq_cancel_free(cancel));
  for (xq_text* text : {&_text, &_second, &_third}) expectSuccess(xq_text_free(text));
}

// --- callbacks -----------------------------------------------------------------------------------

ptrdiff_t Session::read(void* session, char* buffer, size_t size) {
  const std::string_view line = static_cast<Session*>(session)->_input.line();
  if (line == "fail") return -1;
  const size_t count = line.size() < size ? line.size() : size;
  if (count) std::memcpy(buffer, line.data(), count);
  return static_cast<ptrdiff_t>(count);
}

int Session::trace(void* session, const xq_value* value, const char*, size_t) {
  auto& self = *static_cast<Session*>(session);
  if (self._running && xq_context_free(self._running) != XQ_USAGE)
    fail("a context in use is freed");
  if (xq_value_free(const_cast<xq_value*>(value)) != XQ_USAGE) fail("a lent value is freed");
  size_t count = 0;
  if (xq_value_count(value, &count) != XQ_OK) fail("a lent value cannot be read");
  return self._input.byte() == 7;
}

xq_status Session::receive(void* session, const xq_value* item) {
  auto& self = *static_cast<Session*>(session);
  self.expectText(xq_value_xml(item, 0, &self._text));
  const uint8_t answer = self._input.byte();
  if (answer == 3) expectStatus(xq_value_node(item, 0, self.emptied(self._nodes, xq_node_free)));
  return answer == 1 ? XQ_END : answer == 2 ? XQ_INTERNAL : XQ_OK;
}

xq_status Session::load(void* session, const char*, size_t, xq_purpose, xq_resource* resource) {
  Input& input = static_cast<Session*>(session)->_input;
  const uint8_t answer = input.byte();
  const std::string_view data = input.line();
  expectStatus(xq_resource_set_data(resource, data.data(), data.size()));
  if (answer == 1) expectStatus(xq_resource_set_status(resource, input.byte() * 4));
  if (answer == 2) expectStatus(xq_resource_set_media_type(resource, "text/html", XQ_NUL));
  return answer == 3 ? XQ_END : answer == 4 ? XQ_MEMORY : XQ_OK;
}

// --- families of functions -----------------------------------------------------------------------

// Options always deny what is not the loader's, and end what takes long.
void Session::callOptions() {
  const uint8_t which = _input.byte() % 8;
  if (which == 0) {
    xq_options** options = emptied(_options, xq_options_free);
    expectHandle(xq_options_new(options), options);
    expectStatus(xq_options_deny_all(*options));
    expectStatus(xq_options_allow_urls_below(*options, "a://h/", XQ_NUL));
    expectStatus(xq_options_set_timeout(*options, 50000000));
    expectStatus(xq_options_set_memory(*options, 100000000));
    return;
  }
  if (which == 1) {
    xq_cancel** cancel = emptied(_cancels, xq_cancel_free);
    return expectHandle(xq_cancel_new(cancel), cancel);
  }
  xq_options* options = used(_options);
  const std::string_view text = which >= 6 ? _input.line() : std::string_view("");
  switch (which) {
    case 2:
      return expectStatus(xq_options_set_cancel(options, used(_cancels)));
    case 3:
      expectStatus(xq_cancel_raise(used(_cancels)));
      return expectStatus(xq_cancel_lower(used(_cancels)));
    case 4:
      return expectStatus(xq_options_set_way(options, _input.number(XQ_WAY_PROFILED)));
    case 5:  // on the thread that evaluates, which has to be without limits then
      expectStatus(xq_options_clear_limits(options));
      return expectStatus(xq_options_set_loader(options, load, this, nullptr));
    case 6:
      return expectStatus(xq_options_set_base_url(options, text.data(), text.size()));
    default:
      int isAllowed = 0;
      return expectStatus(xq_options_allows_url(options, text.data(), text.size(), &isAllowed));
  }
}

void Session::callReading() {
  const int flags = _input.number(XQ_READ_STRIP_SPACE + XQ_READ_CDATA);
  const bool isInPieces = _input.byte() % 2;
  xq_node** document = emptied(_nodes, xq_node_free);
  xq_error** error = anError();
  if (isInPieces) return expectHandle(xq_read_input(read, this, flags, document, error), document);
  const std::string_view text = _input.line();
  expectHandle(xq_read_memory(text.data(), text.size(), flags, document, error), document);
}

void Session::callNode() {
  const xq_node* node = used(_nodes);
  int answer = 0;
  switch (_input.byte() % 6) {
    case 0: {
      xq_node* there = nullptr;
      expectHandle(xq_node_step(node, _input.number(XQ_STEP_NEXT_NAMESPACE), &there), &there);
      xq_node** to = emptied(_nodes, xq_node_free);
      *to = there;
      return;
    }
    case 1:
      return expectStatus(xq_node_move(used(_nodes), _input.number(XQ_STEP_NEXT_NAMESPACE)));
    case 2:
      return expectStatus(xq_node_compare(node, used(_nodes), &answer));
    case 3:
      return expectStatus(xq_node_is_same(node, used(_nodes), &answer));
    case 4:
      return expectStatus(xq_node_write(node, _input.number(XQ_WRITE_INDENTED), write, this));
    default: {
      xq_node* child = nullptr;
      expectHandle(xq_node_child(node, _input.byte(), &child), &child);
      xq_node** to = emptied(_nodes, xq_node_free);
      *to = child;
    }
  }
}

void Session::callNodeText() {
  const xq_node* node = used(_nodes);
  static constexpr xq_status (*texts[])(const xq_node*, xq_text*) = {
      xq_node_name,   xq_node_local_name, xq_node_prefix,      xq_node_namespace_uri,
      xq_node_string, xq_node_path,       xq_node_document_uri};
  const uint8_t which = _input.byte() % 9;
  if (which < std::size(texts)) return expectText(texts[which](node, &_text));
  const std::string_view name = _input.line();
  if (which == 7) return expectText(xq_node_attribute(node, name.data(), name.size(), &_text));
  expectText(xq_node_attribute_ns(node, "u", 1, name.data(), name.size(), &_text));
}

void Session::callMaking() {
  xq_value* value = used(_values);
  const uint8_t which = _input.byte() % 9;
  if (which == 0) {
    xq_value** made = emptied(_values, xq_value_free);
    return expectHandle(xq_value_new(made), made);
  }
  if (which == 1) return expectStatus(xq_value_add_integer(value, _input.wide()));
  if (which == 2) return expectStatus(xq_value_add_double(value, 1.0 / _input.byte()));
  if (which == 3) return expectStatus(xq_value_add_boolean(value, _input.byte() % 2));
  if (which == 4) return expectStatus(xq_value_add_node(value, used(_nodes)));
  const int type = _input.byte() % 60;
  const std::string_view text = _input.line();
  if (which == 5) return expectStatus(xq_value_add_string(value, text.data(), text.size()));
  if (which == 6) return expectStatus(xq_value_add_untyped(value, text.data(), text.size()));
  if (which == 7) return expectStatus(xq_value_add_bytes(value, type, text.data(), text.size()));
  expectStatus(xq_value_add_text(value, type, text.data(), text.size()));
}

void Session::callMakingMore() {
  xq_value* value = used(_values);
  const uint8_t which = _input.byte() % 5;
  if (which == 0) {
    // Doubling again and again takes all memory.
    size_t count = 0;
    const xq_value* other = used(_values);
    if (xq_value_count(other, &count) == XQ_OK && count > 1000) return;
    return expectStatus(xq_value_add_all(value, other));
  }
  if (which == 1) {
    xq_value* copy = nullptr;
    expectHandle(xq_value_copy(value, &copy), &copy);
    *emptied(_values, xq_value_free) = copy;
    return;
  }
  const int type = _input.byte() % 32;
  if (which == 2) {
    const auto small = [&] { return static_cast<int32_t>(static_cast<int8_t>(_input.byte())); };
    xq_date_time fields = {
        static_cast<int32_t>(_input.wide()), small(), small(),       small(), small(), small(),
        static_cast<int32_t>(_input.wide()), small(), small() * 1800};
    return expectStatus(xq_value_add_date_time(value, type, &fields));
  }
  if (which == 3) {
    const xq_duration duration = {_input.byte() % 2, _input.wide(), _input.wide(),
                                  static_cast<int32_t>(_input.wide())};
    return expectStatus(xq_value_add_duration(value, type, &duration));
  }
  const std::string_view uri = _input.line();
  const std::string_view local = _input.line();
  const std::string_view prefix = _input.line();
  expectStatus(xq_value_add_qname(value, uri.data(), uri.size(), local.data(), local.size(),
                                  prefix.data(), prefix.size()));
}

void Session::callItem() {
  const xq_value* value = used(_values);
  const uint8_t which = _input.byte() % 7;
  const size_t at = static_cast<size_t>(_input.byte()) - 1;
  int64_t integer = 0;
  uint64_t natural = 0;
  double number = 0;
  int small = 0;
  if (which == 0) return expectText(xq_value_string(value, at, &_text));
  if (which == 1) return expectText(xq_value_xml(value, at, &_text));
  if (which == 2) return expectText(xq_value_type_name(value, at, &_text));
  if (which == 3) return expectText(xq_value_bytes(value, at, &_text));
  if (which == 4) {
    expectStatus(xq_value_integer(value, at, &integer));
    return expectStatus(xq_value_unsigned(value, at, &natural));
  }
  if (which == 5) return expectStatus(xq_value_double(value, at, &number));
  expectStatus(xq_value_type(value, at, &small));
  expectStatus(xq_value_boolean(value, at, &small));
}

// What a value tells of its fields makes the same value again.
void Session::callItemMore() {
  const xq_value* value = used(_values);
  const uint8_t which = _input.byte() % 5;
  size_t at = static_cast<size_t>(_input.byte()) - 1;
  if (which == 0) return expectStatus(xq_value_next(value, &at));
  if (which == 1) return expectText(xq_value_qname(value, at, &_second, &_text, &_third));
  if (which == 2) {
    xq_node* node = nullptr;
    expectHandle(xq_value_node(value, at, &node), &node);
    *emptied(_nodes, xq_node_free) = node;
    return;
  }
  if (which == 3) {
    xq_date_time fields;
    return expectStatus(xq_value_date_time(value, at, &fields));
  }
  xq_duration duration;
  expectStatus(xq_value_duration(value, at, &duration));
  if (duration.months < 0 || duration.seconds < 0) fail("a duration with two signs");
}

void Session::callQuery() {
  const uint8_t which = _input.byte() % 8;
  xq_warning warning;
  if (which == 6) {
    return expectText(xq_query_plan(used(_queries), _input.number(XQ_PLAN_DOT), &_text));
  }
  if (which == 7) {
    expectText(xq_query_stream_plan(used(_queries), &_text));
    return expectStatus(xq_query_warning(used(_queries), _input.byte(), &warning));
  }
  // Never without options, which would load from anywhere.
  xq_options* options = used(_options);
  if (!options) return;
  const std::string_view text = _input.line();
  xq_query** query = emptied(_queries, xq_query_free);
  expectHandle(xq_compile(text.data(), text.size(), options, query, anError()), query);
}

void Session::callContext() {
  const uint8_t which = _input.byte() % 7;
  if (which == 0) {
    static constexpr xq_namespace namespaces[] = {{"p", "u"}, {"", "v"}};
    xq_context** context = emptied(_contexts, xq_context_free);
    const size_t count = _input.byte() % 3;
    return expectHandle(xq_context_new_with_namespaces(namespaces, count, context), context);
  }
  xq_context* context = used(_contexts);
  if (which == 1) return expectStatus(xq_context_set_node(context, used(_nodes)));
  if (which == 2) return expectStatus(xq_context_set_item(context, used(_values), _input.byte()));
  if (which == 3) {
    expectStatus(xq_context_set_trace(context, trace, this, nullptr));
    return expectStatus(xq_context_set_missing(context, missing, this, nullptr));
  }
  if (which == 4) return expectStatus(xq_context_clear_variables(context));
  const std::string_view name = _input.line();
  if (which == 5) {
    return expectStatus(xq_context_set_variable(context, name.data(), name.size(), used(_values)));
  }
  expectStatus(xq_context_set_variable_node(context, name.data(), name.size(), used(_nodes)));
}

void Session::callEvaluation() {
  xq_context* context = used(_contexts);
  const xq_query* query = used(_queries);
  xq_options* options = used(_options);
  if (!options || xq_context_set_options(context, options) != XQ_OK) return;
  // Without limits for the loader, so that something else has to bound the work.
  expectStatus(xq_options_set_timeout(options, 50000000));
  expectStatus(xq_options_set_loader(options, nullptr, nullptr, nullptr));
  expectStatus(xq_context_set_options(context, options));
  _running = context;
  if (_input.byte() % 4 == 0) {
    expectStatus(xq_stream_input(context, query, read, this, 0, receive, this, anError()));
  } else {
    xq_value** items = emptied(_values, xq_value_free);
    expectHandle(xq_evaluate(context, query, items, anError()), items);
  }
  _running = nullptr;
}

void Session::callError() {
  const xq_error* error = used(_errors);
  int64_t number = 0;
  int64_t column = 0;
  int category = 0;
  xq_string text;
  xq_place place;
  xq_call call;
  expectStatus(xq_error_number(error, &number));
  expectStatus(xq_error_category(error, &category));
  expectStatus(xq_error_line(error, &number, &column));
  expectStatus(xq_error_place(error, &place));
  expectStatus(xq_error_call(error, _input.byte(), &call));
  expectStatus(xq_error_calls_left_out(error, &number));
  for (const auto read : {xq_error_message, xq_error_description}) {
    expectStatus(read(error, &text));
    if (!text.data || text.data[text.length] != 0) fail("a text of an error does not end");
  }
  xq_error* next = nullptr;
  expectHandle(xq_error_next(error, &next), &next);
  *anError() = next;
}

void Session::callProfile() {
  const uint8_t which = _input.byte() % 3;
  if (which == 0) {
    xq_profile** profile = emptied(_profiles, xq_profile_free);
    return expectHandle(xq_profile_new(used(_queries), profile), profile);
  }
  xq_profile* profile = used(_profiles);
  if (which == 1) return expectStatus(xq_profile_add(profile, used(_contexts)));
  expectText(xq_profile_describe(profile, _input.number(XQ_PROFILE_HTML), "q", 1, &_text));
}

void Session::call() {
  static constexpr void (Session::*families[])() = {
      &Session::callOptions,  &Session::callReading,    &Session::callNode,
      &Session::callNodeText, &Session::callMaking,     &Session::callMakingMore,
      &Session::callItem,     &Session::callItemMore,   &Session::callQuery,
      &Session::callContext,  &Session::callEvaluation, &Session::callError,
      &Session::callProfile,
  };
  (this->*families[_input.byte() % std::size(families)])();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input input(data, size);
  Session session(input);
  while (!input.isOver()) session.call();
  return 0;
}
