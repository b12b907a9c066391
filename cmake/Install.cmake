# The install tree is added here as its parts come to stand.
