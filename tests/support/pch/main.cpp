// The executable that carries the tests' precompiled GoogleTest headers.
int main() { return 0; }
