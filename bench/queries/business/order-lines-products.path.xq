(: Lines of orders of gold customers with a product of one group. :)
declare namespace c = "urn:example:customers";
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
count(//o:order[@customer = //c:customer[@class = "gold"]/@id]
      /o:line[@sku = //p:product[@group = "g7"]/@sku])
