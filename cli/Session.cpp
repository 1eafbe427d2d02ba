#include "Session.h"

#include "Declarations.h"
#include "Documents.h"
#include "Evaluation.h"
#include "History.h"
#include "ItemWriter.h"
#include "LineEditor.h"
#include "Messages.h"
#include "MissingDocuments.h"
#include "NameCompletion.h"
#include "Reports.h"
#include "Results.h"
#include "SessionInput.h"
#include "SessionMessages.h"
#include "Signals.h"
#include "Streams.h"
#include "Timing.h"
#include "xquery/LimitedWork.h"
#include "xquery/xquery.h"

#include <cstdlib>
#include <memory>
#include <string>
#include <string_view>
#include <unistd.h>

namespace cli {
namespace {

using namespace xquery;

constexpr const char* firstPrompt = "xquery> ";
constexpr const char* nextPrompt = "   ...> ";
constexpr std::string_view blanks = " \t\r\n";

std::string_view trimmed(std::string_view text) {
  text.remove_prefix(std::min(text.find_first_not_of(blanks), text.size()));
  return text.substr(0, text.find_last_not_of(blanks) + 1);
}

// Takes the first word off the text, and the blanks behind it.
std::string takeWord(std::string_view& text) {
  const size_t end = std::min(text.find_first_of(blanks), text.size());
  const std::string word(text.substr(0, end));
  text = trimmed(text.substr(end));
  return word;
}

// As shells read it, which are not asked here.
std::string pathOf(std::string_view text) {
  const char* const home = std::getenv("HOME");
  return (home && text.starts_with("~/") ? home + std::string(text.substr(1)) : std::string(text));
}

void say(const std::string& text) {
  if (!writeAll(STDOUT_FILENO, text)) return;
}

class Session {
 public:
  explicit Session(const Options& options);
  Status run();

 private:
  struct Command {
    const char* name;
    const char* usage;
    const char* help;
    void (Session::*perform)(std::string_view argument);
  };
  static const Command commands[];

  // --- entries
  LineEditor::Event readEntry(std::string& entry);
  bool isComplete(const std::string& entry) const;
  void perform(std::string_view line);
  // The query as it is compiled, with the prolog before it.
  struct Query {
    Declarations declarations;
    std::string body;
    // A prolog alone is no query.
    std::string text() const { return declarations.prolog() + (body.empty() ? "()" : body); }
  };
  Query queryOf(const SessionInput& input) const;
  // `file` is what the entry was read from; empty for the terminal.
  void evaluateEntry(const std::string& entry, const std::string& file);
  void evaluate(const Query& query, const Options& options);
  // Runs the work; what fails is reported as the options say, and false answered.
  template <class Work>
  bool reporting(const Query& query, const Work& work);

  // --- commands
  void load(std::string_view argument);
  void bind(std::string_view argument);
  Ref<NSXMLDocument> read(const std::string& path) const;
  void showPlan(std::string_view argument);
  void switchTime(std::string_view argument);
  void help(std::string_view argument);
  void quit(std::string_view argument);
  void refuse(const std::string& message) { writeMessage("xquery: " + message + "\n"); }

  Completions complete(const std::string& textBeforeCursor) const;
  std::map<std::string, std::string> namespaces() const;

  Options _options;
  XQueryVariables _constants;
  Value _contextItem;
  std::string _inputName;
  Declarations _declarations;
  std::string _typed;      // of the entry that is being made, the lines before
  std::string _lastQuery;  // the body that :plan is about
  bool _hasEnded = false;
  History _history;
  LineEditor _editor;
};

const Session::Command Session::commands[] = {
    {":doc", ":doc NAME FILE", "bind $NAME to a document; with \".\" make it the context item",
     &Session::bind},
    {":help", ":help", "this list", &Session::help},
    {":load", ":load FILE", "evaluate a query file, and keep what it declares; or import a module",
     &Session::load},
    {":plan", ":plan [QUERY]", "how the query, or the last one, is evaluated", &Session::showPlan},
    {":quit", ":quit", "end the session, as Ctrl-D does", &Session::quit},
    {":time", ":time", "report the time of each phase from now on, or no more",
     &Session::switchTime}};

Session::Session(const Options& options)
    : _options(options),
      _constants(bindConstants(options)),
      _editor([this](const std::string& text) { return complete(text); }) {
  if (!options.inputs.empty()) {
    const std::string& path = options.inputs.front();
    _contextItem = readDocument(options, path, options.html ? Markup::HTML : Markup::XML);
    _inputName = inputName(path);
  }
  // What the options bind need not be declared again, where its name has no prefix of the user's.
  for (const auto& [name, value] : _constants) {
    if (isUnprefixedName(name)) {
      _declarations.add("declare variable $" + name + " external;");
    }
  }
  for (const std::string& entry : _history.entries()) _editor.remember(entry);
}

Status Session::run() {
  if (!_options.quiet) say("xquery " XQUERY_VERSION "; :help lists the commands, Ctrl-D ends\n");
  while (!_hasEnded) {
    interruption()->store(false);
    std::string entry;
    const LineEditor::Event event = readEntry(entry);
    if (event == LineEditor::Event::End) {
      say("\n");
      break;
    }
    if (event == LineEditor::Event::Interrupt) {
      say("\n");
      continue;
    }
    const std::string_view text = trimmed(entry);
    if (text.empty()) continue;
    _history.add(entry);
    _editor.remember(entry);
    if (text.starts_with(':')) {
      perform(text);
    } else {
      evaluateEntry(entry, "");
    }
  }
  return StatusResult;
}

// --- entries -------------------------------------------------------------------------------------

// What is open makes another line part of the entry. Where nothing is and yet the query is not at
// its end, as behind "for $a in 1 to 3", an empty line ends it all the same.
LineEditor::Event Session::readEntry(std::string& entry) {
  _typed.clear();
  for (;;) {
    std::string line;
    const auto event = _editor.read(_typed.empty() ? firstPrompt : nextPrompt, line);
    if (event != LineEditor::Event::Line) {
      _typed.clear();
      return event;
    }
    const bool isEmpty = trimmed(line).empty();
    entry = _typed + line;
    const std::string_view text = trimmed(entry);
    const bool isDone = text.empty() || text.starts_with(':') ||
                        (sessionInput(entry).isComplete && (isEmpty || isComplete(entry)));
    if (isDone) {
      _typed.clear();
      return event;
    }
    _typed = entry + "\n";
  }
}

// Whether the parser has something to say before it has come to the end. Nothing is loaded here.
bool Session::isComplete(const std::string& entry) const {
  XQueryLoading loading;
  loading.policy = XQueryLoadingPolicy::denyAll();
  const auto compiled =
      XQuery::xqueryWithSource(std::string_view(queryOf(sessionInput(entry)).text()), loading);
  const Ref<NSArray> errors = compiled->parseErrors();
  if (!errors) return true;
  const auto* error = dyn_cast<XQueryError>(errors->objectAtIndex(0));
  return !error || !error->msg()->utf8().starts_with("parse error invalid token ()");
}

Session::Query Session::queryOf(const SessionInput& input) const {
  Query query{_declarations, input.body};
  for (const std::string& declaration : input.declarations) query.declarations.add(declaration);
  return query;
}

void Session::evaluateEntry(const std::string& entry, const std::string& file) {
  const SessionInput input = sessionInput(entry);
  Query query = queryOf(input);
  Options options = _options;
  options.queryFile = file;
  if (file.empty()) options.queryText = entry;
  // An entry that only declares is kept when its declarations can be evaluated, one with a query
  // when it compiles: what is wrong with the query is not wrong with them.
  const bool declares = !input.declarations.empty();
  if (!input.body.empty()) {
    if (!reporting(query,
                   [&] { (void)compile(options, NSString::stringWithUTF8(query.text())); })) {
      return;
    }
    if (declares) _declarations = query.declarations;
    _lastQuery = input.body;
  }
  const bool succeeds = reporting(query, [&] { evaluate(query, options); });
  if (succeeds && declares) _declarations = query.declarations;
}

void Session::evaluate(const Query& query, const Options& options) {
  Phases phases;
  const Ref<NSString> source = NSString::stringWithUTF8(query.text());
  if (!source) throw Failure{StatusQueryError, "xquery: not UTF-8 text", {}};
  const Ref<XQuery> compiled = phases.compile.measure([&] { return compile(options, source); });
  Ref<NSArray> items;
  for (unsigned n = 0; n < options.repeat; ++n) {
    Evaluation evaluation(options, std::make_shared<MissingDocuments>(_options));
    items = phases.evaluate.measure(
        [&] { return evaluation.evaluate(*compiled, _constants, _contextItem); });
  }
  const bool isWritten = phases.print.measure([&] {
    Results results(options, framing(options), 1);
    ResultPart part(results, 0);
    part.begin();
    if (items) ItemWriter(options, _inputName, part).write(*items);
    part.end();
    const bool isWhole = results.finish(1);
    if (!results.endsLine()) say("\n");
    return isWhole;
  });
  if (!isWritten) throw Failure{StatusInput, "xquery: cannot write standard output", {}};
  if (interruption()->load()) throw Failure{};
  if (options.time) phases.report(options.repeat > 1);
}

template <class Work>
bool Session::reporting(const Query& query, const Work& work) {
  try {
    work();
    return true;
  } catch (const Failure& failure) {
    if (interruption()->load()) {
      refuse("interrupted");
    } else {
      Options options = _options;
      options.linesBefore = query.declarations.lines();
      writeMessage(report(options, failure));
    }
  } catch (const std::exception& error) {
    refuse(visible(error.what()));
  }
  return false;
}

// --- commands ------------------------------------------------------------------------------------

void Session::perform(std::string_view line) {
  const std::string name = takeWord(line);
  for (const Command& command : commands) {
    if (name == command.name) return (this->*command.perform)(line);
  }
  refuse("unknown command " + visibleName(name) + "; :help lists them");
}

void Session::load(std::string_view argument) {
  if (argument.empty()) return refuse("expected :load FILE");
  Options options = _options;
  options.queryFile = pathOf(argument);
  options.queryText = std::nullopt;
  std::string text;
  if (!reporting({}, [&] { text = queryText(options)->utf8(); })) return;
  // What was declared before will stand before it.
  if (text.starts_with(byteOrderMark)) text.erase(0, byteOrderMark.size());
  const SessionInput input = sessionInput(text);
  const bool isModule =
      !input.declarations.empty() &&
      declarationName(input.declarations.front()).kind == DeclarationName::Kind::Module;
  if (!isModule) return evaluateEntry(text, options.queryFile);
  const Ref<NSURL> URL = NSURL::fileURLWithPath(options.queryFile);
  evaluateEntry(importOfModule(input.declarations.front(), URL->absoluteString()->utf8()), "");
}

void Session::bind(std::string_view argument) {
  const std::string name = takeWord(argument);
  if (argument.empty()) return refuse("expected :doc NAME FILE");
  const bool isContextItem = name == ".";
  const std::string variable = name.starts_with('$') ? name.substr(1) : name;
  if (!isContextItem && !isVariableName(variable)) {
    return refuse("expected the name of a variable, not \"" + visibleName(name) + "\"");
  }
  const std::string path = pathOf(argument);
  reporting({}, [&] {
    if (path == "-") throw Failure{StatusInput, "xquery: standard input is the session's own", {}};
    const Ref<NSXMLDocument> document = read(path);
    if (isContextItem) {
      _contextItem = document;
      _inputName = inputName(path);
    } else {
      _constants[variable] = document;
      _declarations.add("declare variable $" + variable + " external;");
    }
  });
}

// An interrupt ends the reading, and not the session.
Ref<NSXMLDocument> Session::read(const std::string& path) const {
  XQueryLimits limits;
  limits.cancelled = interruption();
  Ref<NSXMLDocument> document;
  const auto error = XQueryWithinLimits(limits, [&] {
    document = readDocument(_options, path, _options.html ? Markup::HTML : Markup::XML);
  });
  if (error) throw Failure{StatusInput, description(*error), {error}};
  return document;
}

void Session::showPlan(std::string_view argument) {
  const SessionInput input = sessionInput(argument.empty() ? _lastQuery : std::string(argument));
  if (input.body.empty()) return refuse("no query was evaluated yet; :plan QUERY shows one");
  const Query query = queryOf(input);
  Options options = _options;
  options.queryText = query.body;
  options.plan = XQueryPlanFormat::Text;
  reporting(query, [&] {
    const Ref<XQuery> compiled = compile(options, NSString::stringWithUTF8(query.text()));
    const std::string plan = visible(compiled->planDescription(*options.plan)->utf8());
    say(withoutPrologLines(plan, query.declarations.lines()));
  });
}

void Session::switchTime(std::string_view) {
  _options.time = !_options.time;
  say(_options.time ? "times are reported\n" : "times are not reported\n");
}

void Session::help(std::string_view) {
  std::string text;
  for (const Command& command : commands) {
    const std::string usage = command.usage;
    text += usage + std::string(16 - std::min<size_t>(usage.size(), 15), ' ') + command.help + "\n";
  }
  say(text +
      "Anything else is a query. What it declares, ended by a semicolon, stays for later ones.\n"
      "Tab completes names; Ctrl-C ends an evaluation, or drops what was typed.\n");
}

void Session::quit(std::string_view) {
  _hasEnded = true;
}

// --- completion ----------------------------------------------------------------------------------

std::map<std::string, std::string> Session::namespaces() const {
  std::map<std::string, std::string> all = _declarations.namespaces();
  all.insert(_options.namespaces.begin(), _options.namespaces.end());
  return all;
}

Completions Session::complete(const std::string& textBeforeCursor) const {
  std::vector<const char*> names;
  for (const Command& command : commands) names.push_back(command.name);
  return completeName(textBeforeCursor, _typed, _declarations, namespaces(), names);
}

}  // namespace

Status runSession(const Options& options) {
  // There is no session yet that an interrupt could leave alone while its INPUT is read.
  Session session(options);
  surviveInterrupts();
  return session.run();
}

}  // namespace cli
