(: How many persons earn more than 50000. :)
count(/site/people/person[some $income in profile/@income satisfies number($income) > 50000])
