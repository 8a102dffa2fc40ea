// Stands for the headers that all tests share; see CMakeLists.txt beside it.
int main()
{
    return 0;
}
