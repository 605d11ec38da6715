// A runtime library that knows only the two later generations of the discovery factory. Each gives a token, not an object.
extern "C" __attribute__( ( visibility( "default" ) ) ) void* CreateDeckLinkDiscoveryInstance_0003() { return reinterpret_cast<void*>( 3 ); }

extern "C" __attribute__( ( visibility( "default" ) ) ) void* CreateDeckLinkDiscoveryInstance_0002() { return reinterpret_cast<void*>( 2 ); }
