/* The stub provider of abi_stub_provider.inc, compiled as C. */
#define ABI_PROVIDER_NAME AbiStubC
#include "abi_stub_provider.inc"
