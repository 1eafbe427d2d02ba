(: How many elements below the regions are items. :)
count(/site/regions/*/node()[. instance of element(item)])
