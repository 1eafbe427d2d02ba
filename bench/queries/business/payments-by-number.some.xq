(: Payments of the whole amount of shipped orders, by the number of the order. :)
declare namespace o = "urn:example:orders";
count(//o:payment[some $payment in ., $order in //o:order
                  satisfies ($order/@number = $payment/@order and $order/@status = "shipped")])
