#include "Check/WarningTable.h"

#include <array>

namespace xquery {
namespace {

using ID = XQueryWarningID;

constexpr auto rows = std::to_array<XQueryWarningRow>({
    {ID::UnknownFunction, "unknown-function", "there is no function … that takes …",
     "fails when it is reached"},
    {ID::ArgumentCount, "argument-count", "function … takes …, not …", "fails when it is reached"},
    {ID::AbsentFunction, "absent-function", "function … of XQuery 1.0 is not here: use …",
     "fails when it is reached"},
    {ID::FunctionsNamespace, "functions-namespace",
     "the built-in functions are not in the namespace of …: do not declare its prefix",
     "fails when it is reached"},
    {ID::ExternalFunction, "external-function", "function … is external, and nobody can provide it",
     "the query fails"},
    {ID::UnknownVariable, "unknown-variable", "variable $… is not declared",
     "fails when it is reached, unless the caller gives it a value"},
    {ID::LaterVariable, "later-variable",
     "variable $… has no value yet: it is declared further down", "the query fails"},
    {ID::LeakedVariable, "leaked-variable", "variable $… belongs to a clause that has ended",
     "XQuery 1.0 does not see it any more"},
    {ID::UndeclaredPrefix, "undeclared-prefix", "prefix … is not declared",
     "fails when it is reached, unless the caller declares it"},
    {ID::ConstructorNamespace, "constructor-namespace",
     "name test … does not take the namespace of the constructor around it",
     "XQuery 1.0 looks in that namespace"},
    {ID::UnknownType, "unknown-type", "there is no type …",
     "matches nothing, in XQuery 1.0 an error"},
    {ID::ModuleNamespace, "module-namespace", "no imported module has the namespace …",
     "XQuery 1.0 refuses the import"},

    {ID::UnusedVariable, "unused-variable", "variable $… is never used", "of no use"},
    {ID::UnusedFunction, "unused-function", "function … is never called", "of no use"},
    {ID::ConstantCondition, "constant-condition", "the condition is always …: …",
     "part of the query is never evaluated, or the condition of no use"},
    {ID::ImpossibleType, "impossible-type", "no value here is of the type …",
     "the test is false, the case never taken, the rest fails"},
    {ID::StepNeverMatches, "step-never-matches", "step … finds nothing: …", "always empty"},
    {ID::StepFromValue, "step-from-value", "step … begins at …, which is no node",
     "fails when it is reached"},

    {ID::ComparisonFails, "comparison-fails", "… cannot be compared with … by …",
     "fails when it is reached"},
    {ID::OperandFails, "operand-fails", "… cannot be an operand of …", "fails when it is reached"},
    {ID::URIComparison, "uri-comparison", "a URI cannot be compared with … by …: use string()",
     "XQuery 1.0 compares URIs as strings"},
    {ID::DurationComparison, "duration-comparison", "… cannot be compared with … by …",
     "XQuery 1.0 compares durations of any kind"},
    {ID::DateAndTime, "date-and-time", "… compares … with … by the instants they stand for",
     "XQuery 1.0 refuses that"},
    {ID::TruthOrder, "truth-order", "… orders a truth value and …", "XQuery 1.0 refuses that"},
    {ID::FloatAsDouble, "float-as-double", "… compares a float with … as doubles",
     "XQuery 1.0 compares them as floats"},
    {ID::NaNComparison, "nan-comparison", "… is false for NaN",
     "in XQuery 1.0 NaN is unequal to everything"},
    {ID::EmptyComparison, "empty-comparison",
     "a comparison with an empty side gives nothing, and not false: use boolean()",
     "in XQuery 1.0 it is false"},
    {ID::UntypedText, "untyped-text", "… gives an untyped value, which …: use xs:string()",
     "in XQuery 1.0 it gives strings"},
    {ID::UntypedIdiv, "untyped-idiv", "idiv cuts untyped values to integers before it divides",
     "XQuery 1.0 takes them for doubles"},
    {ID::RangeOfFractions, "range-of-fractions", "a bound of to is cut to an integer",
     "XQuery 1.0 refuses it"},

    {ID::TruthOfSeveral, "truth-of-several", "several values are true, whatever they are",
     "XQuery 1.0 gives them no truth value"},
    {ID::TruthOfValue, "truth-of-value", "… is true, whatever it is",
     "XQuery 1.0 gives it no truth value"},
    {ID::TruthOfURI, "truth-of-uri", "a URI is true, even when it is empty: use string()",
     "in XQuery 1.0 an empty URI is false"},

    {ID::NotConverted, "not-converted", "… is declared as …, is …, and is not converted",
     "XQuery 1.0 converts it"},
    {ID::NotChecked, "not-checked", "… is declared as …, is …, and nobody checks it",
     "in XQuery 1.0 it is an error"},
    {ID::ExternalType, "external-type",
     "the value that the caller gives $… is not checked to be …, nor converted",
     "in XQuery 1.0 another value is an error"},
    {ID::ReadsContext, "reads-context", "function … looks at the context item of its caller",
     "in XQuery 1.0 a function has none"},

    {ID::PlusType, "plus-type", "+ in a type means two or more items",
     "in XQuery 1.0 it means one or more"},
    {ID::NodeSequenceType, "node-sequence-type", "two or more nodes are never of the type …",
     "in XQuery 1.0 they can be"},
    {ID::UntypedType, "untyped-type", "every atomic value is of the type …",
     "in XQuery 1.0 untyped values alone are"},
    {ID::TypeInTest, "type-in-test", "the type … in a test is not looked at",
     "XQuery 1.0 compares the types of nodes"},
    {ID::SchemaTest, "schema-test", "there are no schemas: the test looks at the name … alone",
     "XQuery 1.0 needs a schema for it"},
    {ID::DocumentTest, "document-test", "document-node() with a test in it matches nothing",
     "in XQuery 1.0 it looks at the root element"},
    {ID::CastableOfSeveral, "castable-of-several", "castable as fails for several items",
     "in XQuery 1.0 it is false"},
    {ID::PositionIsDouble, "position-is-double", "$… is a double: it is not of the type …",
     "in XQuery 1.0 it is an integer"},

    {ID::CastFails, "cast-fails", "… cannot be cast to …", "fails when it is reached"},
    {ID::NumberFromFront, "number-from-front",
     "of … the number at its front is read, the rest ignored", "XQuery 1.0 refuses the text"},
    {ID::CastableNumber, "castable-number",
     "castable as … is true for every text that begins with a number",
     "in XQuery 1.0 the whole text must be one"},
    {ID::CastableRefused, "castable-refused", "… castable as … is false",
     "in XQuery 1.0 it is true"},
    {ID::DurationFraction, "duration-fraction", "zeros behind the point are lost: … is read as …",
     "XQuery 1.0 keeps them"},
    {ID::CastAccepts, "cast-accepts", "… is accepted as …", "XQuery 1.0 refuses it"},
    {ID::WrittenOtherwise, "written-otherwise", "… is written as …, and not as …",
     "XQuery 1.0 writes it in that way"},
    {ID::LiteralTooLarge, "literal-too-large", "the number is too large and becomes infinite",
     "in XQuery 1.0 it is an error"},
    {ID::LostCharacter, "lost-character", "a character beyond U+FFFF is lost: …",
     "XQuery 1.0 keeps it"},

    {ID::FractionPosition, "fraction-position", "position … is cut to …",
     "in XQuery 1.0 no item is there"},
    {ID::ReverseOrder, "reverse-order", "the nodes come in the order against the document: …",
     "in XQuery 1.0 they come in document order"},
    {ID::SelfOfAttribute, "self-of-attribute", "self::… selects an attribute here",
     "in XQuery 1.0 it selects elements alone"},
    {ID::FollowingOfAttribute, "following-of-attribute",
     "following of an attribute begins behind its element",
     "XQuery 1.0 begins with the content of the element"},
    {ID::PathOverValues, "path-over-values", "the path goes on from …, which is no node",
     "in XQuery 1.0 it is an error"},
    {ID::ValuesMerged, "values-merged", "of equal values that the last step gives one is kept",
     "XQuery 1.0 keeps all of them"},
    {ID::PositionInStep, "position-in-step", "…() in a step is always 1",
     "in XQuery 1.0 it counts the nodes before the step"},

    {ID::OrderDirections, "order-directions", "the direction of the first key holds for all keys",
     "in XQuery 1.0 each key has its own"},
    {ID::OrderEmpty, "order-empty", "what the first key says of empty values holds for all keys",
     "in XQuery 1.0 each key has its own"},
    {ID::OrderKey, "order-key", "… cannot be a key of order by: use string()",
     "XQuery 1.0 orders it"},
    {ID::Collation, "collation", "collation … has no effect", "XQuery 1.0 compares by it"},
    {ID::QuantifierClauses, "quantifier-clauses",
     "a clause of … that is not the last one is passed over when it is empty",
     "in XQuery 1.0 that decides the answer"},

    {ID::EndTag, "end-tag", "the end tag of <…> is </…>", "in XQuery 1.0 it is an error"},
    {ID::LateAttribute, "late-attribute", "an attribute after other content is dropped",
     "in XQuery 1.0 it is an error"},
    {ID::DocumentElements, "document-elements", "a document has one element at most",
     "in XQuery 1.0 it may have several"},
    {ID::EnclosedNamespace, "enclosed-namespace",
     "of the value of … the part before the expression is taken", "in XQuery 1.0 it is an error"},
    {ID::LineEndReference, "line-end-reference",
     "a reference to a tab or a line end becomes a space in an attribute", "XQuery 1.0 keeps it"},
    {ID::Validate, "validate", "validate gives nothing and evaluates nothing",
     "XQuery 1.0 checks against a schema"},
    {ID::SchemaImport, "schema-import", "no schema is loaded for …",
     "XQuery 1.0 knows the types of the schema"},
    {ID::BaseURI, "base-uri", "the first element of the result is marked with xml:base",
     "XQuery 1.0 does not write the base URI"},

    {ID::SubsequenceStart, "subsequence-start",
     "subsequence from … does not count the places before the first item",
     "XQuery 1.0 counts them"},
    {ID::DeepEqual, "deep-equal", "deep-equal compares the attributes of its first argument alone",
     "XQuery 1.0 compares all attributes"},
    {ID::IndexOfNode, "index-of-node", "index-of does not take the value of a node: use string()",
     "XQuery 1.0 does"},
    {ID::FindsNothing, "finds-nothing", "… finds nothing in any document",
     "XQuery 1.0 finds the elements"},
    {ID::AggregateOfURIs, "aggregate-of-uris", "… does not take URIs: use string()",
     "XQuery 1.0 takes them for strings"},
    {ID::BaseURIOfDocument, "base-uri-of-document",
     "base-uri of a document is what xml:base says: use document-uri()",
     "in XQuery 1.0 it is the address of the document"},
    {ID::NormalForm, "normal-form",
     "there is no normal form …: names of normal forms are in capitals",
     "XQuery 1.0 takes them in any case"},
    {ID::PatternDiffers, "pattern-differs", "… in a pattern means something else here",
     "patterns are those of Perl"},
    {ID::PatternFails, "pattern-fails", "pattern …: …", "fails when it is reached"},
    {ID::CallDiffers, "call-differs", "…: …", "XQuery 1.0 answers something else"},
});

constexpr bool isInOrder() {
  for (size_t i = 0; i < rows.size(); ++i) {
    if (static_cast<size_t>(rows[i].id) != i) return false;
  }
  return rows.size() == static_cast<size_t>(ID::Count);
}
static_assert(isInOrder());

}  // namespace

std::span<const XQueryWarningRow> XQueryWarningRows() {
  return rows;
}

const XQueryWarningRow& XQueryWarningRowOf(XQueryWarningID id) {
  return rows[static_cast<size_t>(id)];
}

}  // namespace xquery
