(: Payments more than a year after their order. :)
declare namespace o = "urn:example:orders";
count(for $order in //o:order, $payment in //o:payment
      where $payment/@order = $order/@number
        and year-from-date($payment/@date) > year-from-date($order/@date) + 1
      return $payment)
