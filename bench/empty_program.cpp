// The yardstick of commands: what any C++ program pays for.
int main() { return 0; }
