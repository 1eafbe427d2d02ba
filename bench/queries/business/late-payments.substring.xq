(: Payments more than a year after their order. :)
declare namespace o = "urn:example:orders";
count(for $payment in //o:payment, $order in //o:order
      where $order/@number = $payment/@order
        and number(substring($payment/@date, 1, 4)) > number(substring($order/@date, 1, 4)) + 1
      return $payment)
