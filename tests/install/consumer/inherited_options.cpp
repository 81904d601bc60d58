// The warnings of the project's own build, -Werror among them, are its own affair.
static_assert(sizeof INHERITED_OPTIONS == 1, "the libraries give compile options to their users");
