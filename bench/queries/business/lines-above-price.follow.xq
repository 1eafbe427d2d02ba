(: Lines sold above the price of their product. :)
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
count(for $line in //o:line
      where number($line/@price) > number(//p:product[@sku = $line/@sku]/p:price)
      return $line)
