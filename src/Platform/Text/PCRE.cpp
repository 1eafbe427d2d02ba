// Bounding the cost. The library's own match limit counts anew at every place where a match might
// start, and not at all inside the loops that step through one repeated item, so it bounds nothing
// by itself. Therefore patterns are compiled with a callout before every item, which costs little
// in machine code, and the callouts count: one unit each, and the distance that the match has moved
// since the last one. The units that an operation may spend grow with its subject, so an expensive
// pattern fails at the same place on every machine. Back references compare text that no callout
// sees; there the time of the processor is watched besides. The same place is where the engine's
// deadline and cancellation are looked at.
#define PCRE2_CODE_UNIT_WIDTH 8
#include "Platform/Text/PCRE.h"

#include "Platform/Base/Stack.h"
#include "Platform/Base/ThreadClock.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Text/PCREClassicSyntax.h"
#include "Platform/Text/PlainPattern.h"
#include "Platform/Text/UTF8.h"

#include <pcre2.h>

#include <algorithm>
#include <array>
#include <exception>
#include <new>
#include <optional>

namespace xquery {
namespace {

// A unit takes some 5 ns in machine code and 20 ns interpreted. A pattern may try hundreds of items
// at each place of its subject, as a list of words does, and is not to fail for a subject's length.
constexpr int64_t mostUnits = 16'000'000;
constexpr int64_t mostUnitsPerByte = 512;
constexpr int64_t unitsPerLook = 2048;  // about a step of work
constexpr size_t bytesPerUnit = 8;
constexpr int64_t unitsPerSearch = 16;
constexpr int64_t unitsPerBackReference = 8;

// Compiling recurses with the nesting of groups, of which 250 levels are allowed.
constexpr size_t compilingStack = size_t{512} << 10;

constexpr double mostSeconds = 0.5;
constexpr double mostSecondsPerByte = 16e-6;
constexpr uint32_t looksPerClock = 32;

constexpr uint32_t matchLimit = 20'000'000;
// Of a pattern without callouts: the limit counts anew at every place of the subject.
constexpr uint32_t fewestMatches = 1000;
constexpr uint32_t depthLimit = 1'000'000;

// The memory for going back, interpreting or not: patterns that recurse without end are to notice
// soon that there is none left.
constexpr size_t firstMemory = size_t{64} << 10;
constexpr size_t leastMemory = size_t{4} << 20;
constexpr size_t memoryPerByte = 256;
constexpr size_t mostMemory = size_t{64} << 20;

// The library needs 20 bytes for each of the pattern while it compiles.
constexpr size_t mostPatternBytes = size_t{2} << 20;
// 250 open groups take 190 KB of stack to compile.
constexpr uint32_t nestLimit = 250;

// Translating to machine code pays from the second search or for a long subject.
constexpr size_t longSubject = 512;

struct OptionPair {
  uint32_t classic;
  uint32_t current;
};

constexpr auto compileOptions = std::to_array<OptionPair>({
    {PCRECaseless, PCRE2_CASELESS},
    {PCREMultiline, PCRE2_MULTILINE},
    {PCREDotAll, PCRE2_DOTALL},
    {PCREExtended, PCRE2_EXTENDED},
    {PCREAnchored, PCRE2_ANCHORED},
    {PCREDollarEndOnly, PCRE2_DOLLAR_ENDONLY},
    {PCREUngreedy, PCRE2_UNGREEDY},
    {PCREUTF8, PCRE2_UTF},
    {PCRENoAutoCapture, PCRE2_NO_AUTO_CAPTURE},
    {PCRENoUTF8Check, PCRE2_NO_UTF_CHECK},
});

constexpr auto matchOptions = std::to_array<OptionPair>({
    {PCREAnchored, PCRE2_ANCHORED},
    {PCRENotBOL, PCRE2_NOTBOL},
    {PCRENotEOL, PCRE2_NOTEOL},
    {PCRENotEmpty, PCRE2_NOTEMPTY},
    {PCRENoUTF8Check, PCRE2_NO_UTF_CHECK},
});

template <size_t count>
uint32_t mapped(uint32_t options, const std::array<OptionPair, count>& table) {
  uint32_t result = 0;
  for (const OptionPair& pair : table) {
    if (options & pair.classic) result |= pair.current;
  }
  return result;
}

template <class T>
T* required(T* block) {
  if (!block) throw std::bad_alloc();
  return block;
}

PCRE2_SPTR bytes(std::string_view text) {
  return reinterpret_cast<PCRE2_SPTR>(text.data() ? text.data() : "");
}

struct Free {
  void operator()(pcre2_compile_context* context) const { pcre2_compile_context_free(context); }
  void operator()(pcre2_match_context* context) const { pcre2_match_context_free(context); }
  void operator()(pcre2_match_data* data) const { pcre2_match_data_free(data); }
  void operator()(pcre2_jit_stack* stack) const { pcre2_jit_stack_free(stack); }
  void operator()(pcre2_code* code) const { pcre2_code_free(code); }
};
template <class T>
using Owned = std::unique_ptr<T, Free>;

Owned<pcre2_compile_context> makeCompileContext() {
  Owned<pcre2_compile_context> context(required(pcre2_compile_context_create(nullptr)));
  // Whatever the library was built with.
  pcre2_set_newline(context.get(), PCRE2_NEWLINE_LF);
  pcre2_set_bsr(context.get(), PCRE2_BSR_UNICODE);
  pcre2_set_parens_nest_limit(context.get(), nestLimit);
  pcre2_set_max_pattern_length(context.get(), mostPatternBytes);
#ifdef PCRE2_EXTRA_ALLOW_LOOKAROUND_BSK
  pcre2_set_compile_extra_options(context.get(), PCRE2_EXTRA_ALLOW_LOOKAROUND_BSK);
#endif
  return context;
}

// One way of compiling after another, as long as an error asks for the next.
class Compiler {
 public:
  Compiler(std::string_view pattern, uint32_t options)
      : _pattern(pattern),
        _options(mapped(options, compileOptions)),
        _literalEscapes(!(options & PCREExtra)),
        _extended((options & PCREExtended) != 0) {}

  Owned<pcre2_code> compile() {
    attempt();
    if (!_code && _literalEscapes && classicMayRead()) {
      _rewritten = PCREClassicSyntax(_pattern, _extended);
      if (_rewritten) {
        _pattern = *_rewritten;
        attempt();
      }
    }
    if (!_code && _error == PCRE2_ERROR_PATTERN_TOO_LARGE) {
      _callouts = false;
      attempt();
    }
    return std::move(_code);
  }

  bool callouts() const { return _callouts; }
  int error() const { return _error; }
  size_t offset() const { return _offset; }

 private:
  bool classicMayRead() const {
    return _error == PCRE2_ERROR_UNKNOWN_ESCAPE || _error == PCRE2_ERROR_ESCAPE_INVALID_IN_CLASS ||
           _error == PCRE2_ERROR_UNSUPPORTED_ESCAPE_SEQUENCE ||
           _error == PCRE2_ERROR_CLASS_INVALID_RANGE;
  }

  void attempt() {
    const uint32_t options = _options | (_callouts ? PCRE2_AUTO_CALLOUT : 0);
    withStack(compilingStack, [&] {
      _code.reset(pcre2_compile(bytes(_pattern), _pattern.size(), options, &_error, &_offset,
                                _context.get()));
    });
  }

  std::string_view _pattern;
  const uint32_t _options;
  const bool _literalEscapes;
  const bool _extended;
  Owned<pcre2_compile_context> _context = makeCompileContext();
  std::optional<std::string> _rewritten;
  Owned<pcre2_code> _code;
  bool _callouts = true;
  int _error = 0;
  size_t _offset = 0;
};

// What an operation has spent of what it may.
class Allowance {
 public:
  Allowance(size_t subjectBytes, bool backReferences)
      : _unitsLeft(mostUnits + static_cast<int64_t>(subjectBytes) * mostUnitsPerByte),
        _seconds(mostSeconds + static_cast<double>(subjectBytes) * mostSecondsPerByte),
        _looksPerClock(backReferences ? 1 : looksPerClock) {}

  // Whether there is something left; may throw.
  bool spend(int64_t units) {
    _untilLook -= units;
    return _untilLook > 0 || look();
  }

 private:
  bool look() {
    const int64_t spent = unitsPerLook - _untilLook;
    _untilLook = unitsPerLook;
    _unitsLeft -= spent;
    checkWork(static_cast<uint64_t>(spent / unitsPerLook));
    return _unitsLeft > 0 && (--_untilClock > 0 || timeIsLeft());
  }

  bool timeIsLeft() {
    _untilClock = _looksPerClock;
    const double now = threadSeconds();
    if (_start == 0) _start = now;
    return now - _start < _seconds;
  }

  int64_t _unitsLeft;
  int64_t _untilLook = unitsPerLook;
  double _start = 0;
  const double _seconds;
  const uint32_t _looksPerClock;
  uint32_t _untilClock = 1;
};

}  // namespace

struct PCREPattern::Code {
  Owned<pcre2_code> code;
  bool callouts = true;
  bool bytewise = false;  // has \C, which may leave the middle of a character as a match's end
  bool backReferences = false;
  bool used = false;
  bool translated = false;
  std::optional<PlainPattern> plain;
  // Those of a search that is over, of the usual room, for the next one.
  Owned<pcre2_match_data> idleData;
  Owned<pcre2_match_context> idleContext;

  template <class T>
  T info(uint32_t what) const {
    T value = {};
    pcre2_pattern_info(code.get(), what, &value);
    return value;
  }

  void translateFor(size_t subjectBytes) {
    if (!translated && (used || subjectBytes >= longSubject)) {
      // Without machine code the library interprets, so a failure needs no care.
      withStack(compilingStack, [&] { pcre2_jit_compile(code.get(), PCRE2_JIT_COMPLETE); });
      translated = true;
    }
    used = true;
  }
};

PCREPattern::PCREPattern(std::unique_ptr<Code> code) : _code(std::move(code)) {}
PCREPattern::~PCREPattern() = default;

std::unique_ptr<PCREPattern> PCREPattern::compile(std::string_view pattern, uint32_t options,
                                                  PCREFailure* failure) {
  Compiler compiler(pattern, options);
  Owned<pcre2_code> compiled = compiler.compile();
  if (!compiled) {
    if (failure) {
      std::array<PCRE2_UCHAR, 256> text = {};
      pcre2_get_error_message(compiler.error(), text.data(), text.size());
      *failure = {reinterpret_cast<const char*>(text.data()), compiler.offset()};
    }
    return nullptr;
  }
  auto code = std::make_unique<Code>();
  code->code = std::move(compiled);
  code->callouts = compiler.callouts();
  code->bytewise = code->info<uint32_t>(PCRE2_INFO_HASBACKSLASHC) != 0;
  code->backReferences = code->info<uint32_t>(PCRE2_INFO_BACKREFMAX) != 0;
  constexpr uint32_t harmless = PCREMultiline | PCREDotAll | PCREDollarEndOnly | PCREUTF8 |
                                PCRENoAutoCapture | PCRENoUTF8Check;
  if ((options & ~harmless) == 0 && (options & PCREUTF8)) code->plain = PlainPattern::of(pattern);
  return std::make_unique<PCREPattern>(std::move(code));
}

size_t PCREPattern::byteCount() const {
  return _code->info<size_t>(PCRE2_INFO_SIZE);
}

struct PCRESearch::State {
  State(PCREPattern::Code& code, std::string_view text, size_t room)
      : pattern(code),
        subject(text),
        matchable(!pattern.bytewise || isASCII(subject)),
        allowance(subject.size(), pattern.backReferences),
        unitsPerCallout(pattern.backReferences ? unitsPerBackReference : 1),
        groupRoom(room) {}
  ~State() {
    if (groupRoom != PCRESearch::usualRoom || !data) return;
    pattern.idleData = std::move(data);
    pattern.idleContext = std::move(context);
  }

  // What the library needs, and a plain pattern does not.
  void prepare() {
    if (data) return;
    pattern.translateFor(subject.size());
    if (groupRoom == PCRESearch::usualRoom && pattern.idleData) {
      data = std::move(pattern.idleData);
      context = std::move(pattern.idleContext);
    } else {
      data.reset(required(pcre2_match_data_create(static_cast<uint32_t>(groupRoom), nullptr)));
      context.reset(required(pcre2_match_context_create(nullptr)));
    }
    pcre2_jit_stack_assign(context.get(), nullptr, nullptr);
    const auto few = static_cast<uint32_t>(static_cast<size_t>(mostUnits) / (subject.size() + 1));
    pcre2_set_match_limit(context.get(),
                          pattern.callouts ? matchLimit : std::max(few, fewestMatches));
    pcre2_set_depth_limit(context.get(), depthLimit);
    pcre2_set_heap_limit(context.get(), static_cast<uint32_t>(memoryLimit() / 1024));
    pcre2_set_callout(context.get(), callout, this);
  }

  size_t memoryLimit() const {
    return std::min(leastMemory + subject.size() * memoryPerByte, mostMemory);
  }

  // Nothing may be thrown through the library: what is thrown is kept and the match ended.
  static int callout(pcre2_callout_block* block, void* self) {
    auto& state = *static_cast<State*>(self);
    const size_t at = block->current_position;
    const size_t moved = at > state.position ? at - state.position : state.position - at;
    state.position = at;
    try {
      const auto units = state.unitsPerCallout + static_cast<int64_t>(moved / bytesPerUnit);
      return state.allowance.spend(units) ? 0 : PCRE2_ERROR_MATCHLIMIT;
    } catch (...) {
      state.interruption = std::current_exception();
      return PCRE2_ERROR_CALLOUT;
    }
  }

  // As the library; it fails no more often than it, whose cost of a match is as much.
  PCRESearch::Outcome findPlain(size_t from) {
    const auto found = pattern.plain->find(subject, from);
    const size_t end = found ? found->end : subject.size();
    if (!allowance.spend(unitsPerSearch + unitsOf(end - from))) return PCRESearch::Outcome::Failed;
    plainMatch = found ? PCRERange{found->start, found->end} : PCRERange();
    groups = found ? 1 : 0;
    return found ? PCRESearch::Outcome::Found : PCRESearch::Outcome::NotFound;
  }
  static int64_t unitsOf(size_t bytesMoved) {
    return static_cast<int64_t>(bytesMoved / (8 * bytesPerUnit));
  }

  int match(size_t from, uint32_t options) {
    prepare();
    plainMatch.reset();
    position = from;
    return pcre2_match(pattern.code.get(), bytes(subject), subject.size(), from, options,
                       data.get(), context.get());
  }

  void growStack() {
    stack.reset(required(pcre2_jit_stack_create(firstMemory, memoryLimit(), nullptr)));
    pcre2_jit_stack_assign(context.get(), nullptr, stack.get());
  }

  PCREPattern::Code& pattern;
  const std::string_view subject;
  const bool matchable;
  Allowance allowance;
  const int64_t unitsPerCallout;
  const size_t groupRoom;
  std::optional<PCRERange> plainMatch;  // none where the library has searched
  size_t position = 0;
  std::exception_ptr interruption;
  Owned<pcre2_match_data> data;
  Owned<pcre2_match_context> context;
  Owned<pcre2_jit_stack> stack;
  size_t groups = 0;
};

PCRESearch::PCRESearch(PCREPattern& pattern, std::string_view subject, size_t room)
    : _state(std::make_unique<State>(*pattern._code, subject, room)) {}

PCRESearch::~PCRESearch() = default;

PCRESearch::Outcome PCRESearch::find(size_t from, uint32_t options) {
  State& state = *_state;
  if (!state.matchable || from > state.subject.size()) return Outcome::Failed;
  if (state.pattern.plain && options == PCRENoUTF8Check) return state.findPlain(from);
  const uint32_t current = mapped(options, matchOptions);
  int count = state.match(from, current);
  // The machine's stack does for most matches.
  if (count == PCRE2_ERROR_JIT_STACKLIMIT && !state.stack) {
    state.growStack();
    count = state.match(from, current);
  }
  if (state.interruption) std::rethrow_exception(state.interruption);
  if (count < 0 && count != PCRE2_ERROR_NOMATCH) return Outcome::Failed;
  state.groups = static_cast<size_t>(std::max(count, 0));
  const size_t reached = count < 0 ? state.subject.size() : group(0).end;
  const size_t moved = reached > from ? reached - from : 0;
  if (!state.allowance.spend(unitsPerSearch + State::unitsOf(moved))) return Outcome::Failed;
  return count < 0 ? Outcome::NotFound : Outcome::Found;
}

PCRERange PCRESearch::group(size_t number) const {
  if (_state->plainMatch) return number == 0 ? *_state->plainMatch : PCRERange();
  // The library does not write to the room of groups that the pattern does not have.
  const size_t known =
      _state->groups > 0 ? _state->groups : pcre2_get_ovector_count(_state->data.get());
  if (number >= known) return {};
  const size_t* const offsets = pcre2_get_ovector_pointer(_state->data.get()) + 2 * number;
  if (offsets[0] == PCRE2_UNSET) return {};
  return {offsets[0], offsets[1]};
}

size_t PCRESearch::groupCount() const {
  return _state->groups;
}

}  // namespace xquery
