// Nothing of its own: it is there for the headers that are compiled with it.

int main() {}
