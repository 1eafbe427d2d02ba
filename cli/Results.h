// The results of all inputs, written in the order of the inputs by threads that come to them in any
// order.
//
// One part, that of the first input that is not done, has its turn: what it writes goes straight
// on. The others keep what they write, and wait for their turn when that is much; and no part
// begins that is far ahead. So the memory taken is bounded however many inputs there are and
// however large their results.
#pragma once

#include "Options.h"
#include "Output.h"

#include <condition_variable>
#include <cstddef>
#include <map>
#include <mutex>
#include <string>
#include <string_view>

namespace cli {

// What stands around and between the items of a result.
struct Framing {
  std::string opening, between, closing;
};

class Results {
 public:
  // `jobs`: how many parts are made at the same time.
  Results(const Options& options, Framing framing, unsigned jobs);

  // Waits until the part may begin. False when nothing can be written any more, or is to be.
  bool begin(size_t number);
  // Called when all parts are done, or once there are to be no more: the result is complete when
  // there is one, unless it was stopped. False when it could not be written; `error` says why.
  [[nodiscard]] bool finish(size_t parts);
  std::string error();
  // What has been written goes to its reader; for streams, which have one part.
  void flush();
  // Whether what was written ends with a line.
  bool endsLine();
  // The gravest that a part ended with.
  Status status();
  // No part goes on, and what was to be written to a file is not.
  void stop();

 private:
  friend class ResultPart;
  struct Part {
    std::string text;
    bool hasResult = false, hasItems = false;
    std::string message;
    Status status = StatusResult;
  };

  bool awaitTurn(size_t number);
  bool isTurn(size_t number);
  // By the part that has its turn.
  bool beginWriting(bool hasItems);
  bool write(std::string_view text);
  void end(size_t number, Part part);
  void endTurn(const Part& part);

  const Options& _options;
  const Framing _framing;
  const size_t _mostAhead;
  std::mutex _mutex;
  std::condition_variable _moved;
  size_t _next = 0;  // whose turn it is
  std::map<size_t, Part> _waiting;
  Output _output;
  bool _isOpen = false, _hasItems = false, _isStopped = false;
  Status _status = StatusResult;
};

// What one input contributes; for one thread.
class ResultPart {
 public:
  ResultPart(Results& results, size_t number) : _results(results), _number(number) {}

  // There is a result, if only an empty one.
  void begin();
  // Before each item.
  void beginItem();
  // False when nothing can be written any more.
  bool append(std::string_view text);
  bool isStopped() const { return _isStopped; }
  // The message is written when the part has its turn.
  void end(Status status = StatusResult, std::string message = {});

 private:
  void takeTurn();

  Results& _results;
  const size_t _number;
  Results::Part _part;
  bool _hasTurn = false, _isStopped = false;
};

}  // namespace cli
