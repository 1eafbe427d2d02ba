(: Payments of the whole amount of shipped orders, by the number of the order. :)
declare namespace o = "urn:example:orders";
count(for $order in //o:order[@status = "shipped"], $payment in //o:payment
      where exactly-one($order/@number) = exactly-one($payment/@order)
      return $payment)
