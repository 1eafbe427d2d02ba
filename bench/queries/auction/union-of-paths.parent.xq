(: The names of items and persons. :)
count(//name[parent::item or parent::person])
