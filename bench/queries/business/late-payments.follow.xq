(: Payments more than a year after their order. :)
declare namespace o = "urn:example:orders";
count(for $payment in //o:payment
      let $order := //o:order[@number = $payment/@order]
      where year-from-date($payment/@date) - 1 > year-from-date($order/@date)
      return $payment)
