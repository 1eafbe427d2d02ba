// All warnings. "…" in a text stands for a name, a type or a text of the query, in the order in
// which they are given.
#pragma once

#include <cstdint>
#include <span>
#include <string_view>

namespace xquery {

enum class XQueryWarningID : uint8_t {
  // Names.
  UnknownFunction,
  ArgumentCount,
  AbsentFunction,
  FunctionsNamespace,
  ExternalFunction,
  UnknownVariable,
  LaterVariable,
  LeakedVariable,
  UndeclaredPrefix,
  ConstructorNamespace,
  UnknownType,
  ModuleNamespace,
  // What is of no use.
  UnusedVariable,
  UnusedFunction,
  ConstantCondition,
  ImpossibleType,
  StepNeverMatches,
  StepFromValue,
  // Operators.
  ComparisonFails,
  OperandFails,
  URIComparison,
  DurationComparison,
  DateAndTime,
  TruthOrder,
  FloatAsDouble,
  NaNComparison,
  EmptyComparison,
  UntypedText,
  UntypedIdiv,
  RangeOfFractions,
  // Truth.
  TruthOfSeveral,
  TruthOfValue,
  TruthOfURI,
  // Declared types.
  NotConverted,
  NotChecked,
  ExternalType,
  ReadsContext,
  // Sequence types.
  PlusType,
  NodeSequenceType,
  UntypedType,
  TypeInTest,
  SchemaTest,
  DocumentTest,
  CastableOfSeveral,
  PositionIsDouble,
  // Casts and literals.
  CastFails,
  NumberFromFront,
  CastableNumber,
  CastableRefused,
  DurationFraction,
  CastAccepts,
  WrittenOtherwise,
  LiteralTooLarge,
  LostCharacter,
  // Paths.
  FractionPosition,
  ReverseOrder,
  SelfOfAttribute,
  FollowingOfAttribute,
  PathOverValues,
  ValuesMerged,
  PositionInStep,
  // Clauses.
  OrderDirections,
  OrderEmpty,
  OrderKey,
  Collation,
  QuantifierClauses,
  // Constructors and the prolog.
  EndTag,
  LateAttribute,
  DocumentElements,
  EnclosedNamespace,
  LineEndReference,
  Validate,
  SchemaImport,
  BaseURI,
  // Built-in functions.
  SubsequenceStart,
  DeepEqual,
  IndexOfNode,
  FindsNothing,
  AggregateOfURIs,
  BaseURIOfDocument,
  NormalForm,
  PatternDiffers,
  PatternFails,
  CallDiffers,
  Count,
};

struct XQueryWarningRow {
  XQueryWarningID id;
  std::string_view identifier;  // for good
  std::string_view text;
  // What would happen or what the final XQuery 1.0 does, in a few words.
  std::string_view about;
};

// In the order of the enumeration.
std::span<const XQueryWarningRow> XQueryWarningRows();
const XQueryWarningRow& XQueryWarningRowOf(XQueryWarningID id);

}  // namespace xquery
