// Contexts: variables, the context item, options, and who hears of traces and missing documents.
#include "C/Contexts.h"

#include "C/Callbacks.h"
#include "C/Nodes.h"
#include "C/Options.h"
#include "C/Texts.h"
#include "C/Values.h"
#include "xquery/Values.h"

#include <map>
#include <string>

using namespace xquery;

namespace xquery::capi {

class Client : public XQueryClient {
 public:
  void setTrace(xq_trace trace, HostData data) {
    _trace = trace;
    _traceData = std::move(data);
  }
  void setMissing(xq_missing missing, HostData data) {
    _missing = missing;
    _missingData = std::move(data);
  }

  void XQueryClientTraceValue(const Value& value, const Ref<NSString>& label,
                              XQueryContext& context) override {
    if (!_trace) return XQueryClient::XQueryClientTraceValue(value, label, context);
    xq_value lent;
    lent.isLent = true;
    if (const auto* items = dyn_cast<NSArray>(value)) {
      lent.items = items->objects();
    } else if (!isa<NSNull>(value)) {
      lent.items.push_back(value);
    }
    const std::string text = label->utf8();
    if (_trace(_traceData.get(), &lent, text.c_str(), text.size()) != 0) throw HostFailed();
  }

  void XQueryClientMissesDocument(const XQueryMissingDocument& document, XQueryContext&) override {
    if (!_missing) return;
    const auto& [URL, reason] = document;
    if (_missing(_missingData.get(), URL.c_str(), URL.size(), reason.c_str(), reason.size()) != 0) {
      throw HostFailed();
    }
  }

 private:
  xq_trace _trace = nullptr;
  HostData _traceData{nullptr, nullptr};
  xq_missing _missing = nullptr;
  HostData _missingData{nullptr, nullptr};
};

}  // namespace xquery::capi

using namespace xquery::capi;

xq_context::xq_context(Ref<XQueryContext> ofEngine)
    : context(std::move(ofEngine)), client(std::make_shared<Client>()) {
  context->contextSetClient(client);
}

xq_context::~xq_context() = default;

namespace {

// Changes a context that nobody uses.
template <class Change>
xq_status changeContext(xq_context* context, Change change) {
  const ContextUse use(context);
  if (!use) return XQ_USAGE;
  return guarded([&]() -> xq_status { return change(*context); });
}

xq_status namespacesOf(const xq_namespace* namespaces, size_t count,
                       std::map<std::string, std::string>& map) {
  for (size_t i = 0; i < count; ++i) {
    if (!namespaces[i].prefix || !namespaces[i].uri) return XQ_USAGE;
    const GivenText prefix(namespaces[i].prefix, XQ_NUL);
    const GivenText URI(namespaces[i].uri, XQ_NUL);
    if (!prefix.string() || !URI.string()) return XQ_INPUT;
    map[std::string(prefix.view())] = URI.view();
  }
  return XQ_OK;
}

}  // namespace

xq_status xq_context_new(xq_context** context) {
  return xq_context_new_with_namespaces(nullptr, 0, context);
}

xq_status xq_context_new_with_namespaces(const xq_namespace* namespaces, size_t count,
                                         xq_context** context) {
  if (!context) return XQ_USAGE;
  *context = nullptr;
  if (!namespaces && count != 0) return XQ_USAGE;
  return guarded([&] {
    std::map<std::string, std::string> map;
    const xq_status status = namespacesOf(namespaces, count, map);
    if (status != XQ_OK) return status;
    return giveNew(context, XQueryContext::xqueryContextWithNamespaces(map));
  });
}

xq_status xq_context_free(xq_context* context) {
  if (!context) return XQ_OK;
  if (!areGood(context) || context->isInUse.load()) return XQ_USAGE;
  return freeHandle(context);
}

xq_status xq_context_set_options(xq_context* context, const xq_options* options) {
  if (options && !areGood(options)) return XQ_USAGE;
  return changeContext(context, [&](xq_context& changed) {
    changed.context->contextSetLoading(options ? options->loading : XQueryLoading());
    changed.context->contextSetLimits(options ? options->limits : XQueryLimits());
    return XQ_OK;
  });
}

// --- variables and the context item --------------------------------------------------------------

namespace {

// Sets a variable to what `make` puts into the value that it is given.
template <class Make>
xq_status setVariable(xq_context* context, const char* name, size_t length, Make make) {
  const GivenText given(name, length);
  if (!given.isGood()) return XQ_USAGE;
  return changeContext(context, [&](xq_context& changed) -> xq_status {
    if (!given.string()) return XQ_INPUT;
    Value value;
    const xq_status status = make(value);
    if (status == XQ_OK) changed.variables[std::string(given.view())] = std::move(value);
    return status;
  });
}

}  // namespace

xq_status xq_context_set_variable(xq_context* context, const char* name, size_t length,
                                  const xq_value* value) {
  if (!areGood(value)) return XQ_USAGE;
  return setVariable(context, name, length, [&](Value& made) {
    made = asOneValue(*value);
    return XQ_OK;
  });
}

xq_status xq_context_set_variable_text(xq_context* context, const char* name, size_t length,
                                       const char* text, size_t text_length) {
  const GivenText given(text, text_length);
  if (!given.isGood()) return XQ_USAGE;
  return setVariable(context, name, length, [&](Value& made) {
    if (!given.string()) return XQ_INPUT;
    made = XQueryMakeUntypedAtomic(given.view()).valueOr(nullptr);
    return made ? XQ_OK : XQ_MISMATCH;
  });
}

xq_status xq_context_set_variable_node(xq_context* context, const char* name, size_t length,
                                       const xq_node* node) {
  if (!areGood(node)) return XQ_USAGE;
  return setVariable(context, name, length, [&](Value& made) {
    made = node->node;
    return XQ_OK;
  });
}

xq_status xq_context_clear_variables(xq_context* context) {
  return changeContext(context, [](xq_context& changed) {
    changed.variables.clear();
    return XQ_OK;
  });
}

xq_status xq_context_set_node(xq_context* context, const xq_node* node) {
  if (!areGood(node)) return XQ_USAGE;
  return changeContext(context, [&](xq_context& changed) {
    changed.item = node->node;
    return XQ_OK;
  });
}

xq_status xq_context_set_item(xq_context* context, const xq_value* value, size_t at) {
  if (!areGood(value)) return XQ_USAGE;
  return changeContext(context, [&](xq_context& changed) {
    if (at >= value->items.size()) return XQ_END;
    changed.item = value->items[at];
    return XQ_OK;
  });
}

// --- who hears -----------------------------------------------------------------------------------

xq_status xq_context_set_trace(xq_context* context, xq_trace trace, void* data,
                               xq_destroy destroy) {
  HostData kept(data, destroy);
  return changeContext(context, [&](xq_context& changed) {
    changed.client->setTrace(trace, std::move(kept));
    return XQ_OK;
  });
}

xq_status xq_context_set_missing(xq_context* context, xq_missing missing, void* data,
                                 xq_destroy destroy) {
  HostData kept(data, destroy);
  return changeContext(context, [&](xq_context& changed) {
    changed.client->setMissing(missing, std::move(kept));
    return XQ_OK;
  });
}
