(: Payments more than a year after their order. :)
declare namespace o = "urn:example:orders";
count(for $order in //o:order
      return //o:payment[@order = $order/@number]
                        [year-from-date(@date) > 1 + year-from-date($order/@date)])
