// A program in C++ that does nothing; what starting and ending it costs is the floor for the tool.
int main() {}
