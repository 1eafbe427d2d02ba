(: How many pieces of prose there are. :)
count(//*[self::description or self::annotation or self::emailaddress])
