(: How many elements below the regions are items. :)
count(/site/regions/*/*:item)
