(: How many orders are of the year 2003. :)
declare namespace o = "urn:example:orders";
let $first := xs:date("2003-01-01"), $last := xs:date("2003-12-31")
return count(for $order in //o:order
             let $date := xs:date($order/@date)
             where $date >= $first and $date <= $last
             return $order)
