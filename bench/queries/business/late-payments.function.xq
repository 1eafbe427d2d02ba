(: Payments more than a year after their order. :)
declare namespace o = "urn:example:orders";
declare function local:year($node) { year-from-date(xs:date($node/@date)) };
let $orders := //o:order
return count(for $payment in //o:payment
             where local:year($payment) > local:year($orders[@number = $payment/@order]) + 1
             return $payment)
