(: The titles of the books that cost no more than a limit given on the command line. A value from
   outside has no type, and so has the text of an element; adding 0 makes the comparison numeric. :)
declare variable $limit external;

//book[price <= $limit + 0]/title
