(: Payments of the whole amount of shipped orders, by the number of the order. :)
declare namespace o = "urn:example:orders";
count(for $payment in //o:payment, $order in //o:order[@status = "shipped"]
      where string($payment/@order) = string($order/@number)
      return $payment)
