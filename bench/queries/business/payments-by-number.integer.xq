(: Payments of the whole amount of shipped orders, by the number of the order. :)
declare namespace o = "urn:example:orders";
count(for $payment in //o:payment, $order in //o:order
      where xs:integer($payment/@order) eq xs:integer($order/@number)
        and $order/@status = "shipped"
      return $payment)
