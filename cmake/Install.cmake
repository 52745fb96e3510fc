# Grows with the tree: what is installed where.
