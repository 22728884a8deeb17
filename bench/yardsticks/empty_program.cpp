// Does nothing, with the libraries that morvend is linked with.
int main() { return 0; }
