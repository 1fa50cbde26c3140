// Test module: a shared library without acrxEntryPoint.
extern "C" __attribute__((visibility("default"))) int VelTest_Entryless()
{
    return 1;
}
