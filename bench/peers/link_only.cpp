// Links what the tool links, and does nothing: what a run costs before the tool's first instruction.
int main() { return 0; }
