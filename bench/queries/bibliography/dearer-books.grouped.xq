(: For each book how many in the same currency are dearer. :)
sum(for $currency in distinct-values(//price/@currency)
    let $prices := for $price in //price[@currency = $currency] return number($price)
    return for $price in $prices return count($prices[. > $price]))
