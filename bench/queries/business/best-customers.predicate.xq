(: The ten customers with most lines. :)
declare namespace c = "urn:example:customers";
declare namespace o = "urn:example:orders";
subsequence(for $customer in //c:customer
            let $lines := //o:order[@customer = $customer/@id]/o:line
            order by count($lines) descending
            return <lines>{count($lines)}</lines>, 1, 10)
