// The stub provider of abi_stub_provider.inc, compiled as C++. Its factories must come out with
// plain C names (extern "C") and default visibility, or the broker could not find them.
#define ABI_PROVIDER_NAME AbiStubCxx
#include "abi_stub_provider.inc"
