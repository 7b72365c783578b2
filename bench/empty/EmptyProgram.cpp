// The baseline of StartupBench: a C++ program that does nothing, built and linked like the tool.
int main()
{
    return 0;
}
