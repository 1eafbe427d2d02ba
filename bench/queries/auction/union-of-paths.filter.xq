(: The names of items and persons. :)
count(//*[self::item or self::person]/name)
