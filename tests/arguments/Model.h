// The rules that all functions share, written for the tests from the rules of the language and not
// from the engine: promotion, atomization, casting by the casting table, effective boolean values.
//
// A rule of a function answers the items that the call must give, throws Refused where the function
// has no answer (error 17), and throws Failure where it raises an error. Where the order in which
// the arguments are looked at is open, it gathers failures with Attempts: any of them may be the
// one that is found.
#pragma once

#include "arguments/Samples.h"

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace xquery::arguments {

// The function answers nothing: wrong number of arguments, or arguments of no use.
struct Refused {};

// Any one of these errors, as "error 6 text". A final "*" stands for any text.
struct Failure {
  std::vector<std::string> texts;
};

[[noreturn]] void fail(int number, const std::string& text);

inline constexpr const char* invalidAtomization = "invalid type for automization";
inline constexpr const char* invalidType = "invalid type";
inline constexpr const char* noMatch = "value does not match a required type";
inline constexpr const char* invalidOperator = "invalid type for operator";

struct Call {
  std::vector<const Sample*> arguments;
  const Sample* contextItem = nullptr;  // null for none
  // What the call may answer besides what the rule says, printed; for what is left open.
  mutable std::vector<std::string> alternatives;

  size_t count() const { return arguments.size(); }
  const Sequence& operator[](size_t index) const { return arguments[index]->items; }
  void orElse(std::string text) const { alternatives.push_back(std::move(text)); }
  void orRefused() const { alternatives.push_back("refused"); }
};

using Rule = std::function<Sequence(const Call&)>;

struct Function {
  std::string name;  // as written in the query
  size_t least;      // the numbers of arguments that it takes
  size_t most;
  Rule rule;
};

// Runs the parts of a rule whose order is open, and throws what they threw, all together.
class Attempts {
 public:
  template <class Work>
  auto operator()(Work work) -> decltype(work()) {
    try {
      return work();
    } catch (const Failure& failure) {
      _texts.insert(_texts.end(), failure.texts.begin(), failure.texts.end());
    } catch (Refused) {
      _texts.push_back("refused");
    }
    return {};
  }
  bool haveFailed() const { return !_texts.empty(); }
  void finish() const {
    if (haveFailed()) throw Failure{_texts};
  }

 private:
  std::vector<std::string> _texts;
};

// --- making items --------------------------------------------------------------------------------

Item string(std::string text);
Item untyped(std::string text);
Item integer(int64_t value);
Item boolean(bool value);
Item number(double value);                            // a double
Item numberOf(int type, double value);                // of any numeric type
Item dayTime(double seconds);                         // prints as a dayTimeDuration
Item anyOf(int type, const std::string& start = "");  // of that type, any text that begins so
Sequence one(Item item);

// "-115.4", "1e+300", "NaN": the shortest digits.
std::string numberText(double value);
std::string dayTimeText(double seconds);

// --- types ---------------------------------------------------------------------------------------

int primitiveType(int type);
bool isStringType(int type);    // plain strings and all that is a string
bool isNumericType(int type);   // double, float, decimal and the integers
bool isNumberObject(int type);  // those, booleans and the two ordered durations
double numericValue(const Item& item);
// The months or seconds of an ordered duration.
double durationValue(const Item& item);

// --- the shared steps ----------------------------------------------------------------------------

Item typedValue(const Item& item);
Sequence atomized(const Sequence& value);
// Of one atomic item, by the table. A URI that does not fit fails like the others.
Item castItem(const Item& item, int target);
// Exactly one item, atomized and cast.
Item castTo(const Sequence& value, int target);
Item promotedToString(const Sequence& value);
std::string stringOf(const Sequence& value);  // its text
// Nothing for the empty sequence.
std::optional<Item> promotedToNumeric(const Sequence& value);
std::optional<Item> promotedToInteger(const Sequence& value);
bool effectiveBooleanValue(const Sequence& value);

bool equalValues(const Item& a, const Item& b);

// UTF-16 units of a UTF-8 text, and back.
std::u16string units(const std::string& utf8);
std::string utf8(const std::u16string& units);
std::string trimmed(const std::string& text);
std::string normalizedSpace(const std::string& text);
// Whether the text is a URI reference.
bool isURI(const std::string& text);

}  // namespace xquery::arguments
