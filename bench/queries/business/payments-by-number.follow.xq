(: Payments of the whole amount of shipped orders, by the number of the order. :)
declare namespace o = "urn:example:orders";
count(for $payment in //o:payment
      where //o:order[@number = $payment/@order]/@status = "shipped"
      return $payment)
