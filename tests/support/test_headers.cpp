// No code of its own: what is compiled here once are the headers that every test takes over.
