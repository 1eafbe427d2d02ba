// libxslt. Nothing else of the library includes its headers.
//
// The documents are handed over as copies and the result is copied back. A transformation runs on a
// thread of its own, for two reasons: libxslt and libxml2 recurse by the nesting of templates,
// expressions and copied trees, for which the stack that a caller has left is no measure; and
// nothing in libxslt asks how long it may go on, so that somebody has to watch it. The calling
// thread does, and loads what the stylesheet names, so that loaders and limits belong to one thread
// as everywhere else.
//
// What libxml2 asks of malloc for a transformation, the copies included, counts as memory of the
// evaluation. It is looked at by the calling thread every few milliseconds, so that a text that
// doubles may exceed the ceiling a few times over before the transformation is stopped.
//
// Most of libxslt can be told to stop. What cannot is left behind when an evaluation ends
// meanwhile: its thread, which shares nothing with anybody, works on until it is done. Compiling is
// bounded beforehand (StylesheetBounds.h), so that it is done soon; what remains are single steps
// over large texts and sets of nodes. While many such threads are left behind the next
// transformation waits for one of them to end. A process of its own could be ended at any time, but
// a library cannot start one without a program to find, nor answer for the signals and descriptors
// of its host.
#pragma once

#include "xquery/XMLNode.h"

#include <atomic>
#include <cstddef>
#include <functional>
#include <string>

namespace xquery {

// The bounds of what libxslt does recursively or in quadratic time. Its own bound on the nesting of
// templates, 3,000, is the reason for that of stylesheets: what nests deeper could not run.
constexpr size_t LibXSLTMostDocumentLevels = 10000;
constexpr size_t LibXSLTMostStylesheetLevels = 3000;
constexpr size_t LibXSLTMostLoads = 1000;

// Tests set another one.
extern std::atomic<int> LibXSLTMostLeftBehind;

struct LibXSLTTask {
  const NSXMLDocument& document;
  std::string documentURL;  // what references in the document are relative to; may be empty
  const NSXMLDocument& stylesheet;
  std::string stylesheetURL;
  const NSXMLDocument::XSLTArguments& arguments;
  // Answers what a stylesheet includes, imports or asks for, or null. Called on the thread that
  // called transformWithLibXSLT; what it throws ends the transformation and is thrown on.
  std::function<Ref<NSXMLDocument>(const std::string& URL, bool isStylesheet)> load;
};

// A string when the output method is text, else a document; null, and why in `failure`, when the
// transformation failed. Ended at a limit of the evaluation, by an exception.
Value transformWithLibXSLT(const LibXSLTTask& task, std::string& failure);

}  // namespace xquery
