// Who gives the items of a clause one after another, so that those behind the last one that is
// asked for are never found.
//
// A clause lists its items and then takes them in turn. It may be given a giver, which finds the
// next item when the one before has been dealt with. Whoever gives one answers for it that nobody
// can tell: that finding items neither fails nor does anything, once what it starts from is there,
// and that dealing with one changes nothing that finding the next depends on.
#pragma once

#include "xquery/Object.h"

namespace xquery {

class XQueryContext;

class XQueryItemGiver {
 public:
  class Taker {
   public:
    // Deals with an item, in the focus in which the clause stands; answers false to end.
    virtual bool take(Value item) = 0;

   protected:
    ~Taker() = default;
  };

  XQueryItemGiver() = default;
  XQueryItemGiver(const XQueryItemGiver&) = delete;
  XQueryItemGiver& operator=(const XQueryItemGiver&) = delete;
  virtual ~XQueryItemGiver() = default;

  // False where there are no items because what they are found from has failed, or where the taker
  // ended for a failure.
  virtual bool giveItems(XQueryContext& context, Taker& taker) const = 0;
};

}  // namespace xquery
