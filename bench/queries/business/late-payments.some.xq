(: Payments more than a year after their order. :)
declare namespace o = "urn:example:orders";
count(for $payment in //o:payment
      where some $order in //o:order
            satisfies ($order/@number = $payment/@order and
                       year-from-date($order/@date) + 1 < year-from-date($payment/@date))
      return $payment)
