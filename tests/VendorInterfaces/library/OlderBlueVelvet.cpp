// A runtime library of the older generation, whose size functions answer with their arguments' digits. It makes no card objects.
#include <cstdint>

#define EXPORTED extern "C" __attribute__( ( visibility( "default" ) ) )

EXPORTED void* bfcFactory() { return nullptr; }
EXPORTED void bfcDestroy( void* ) {}
EXPORTED int bfcEnumerate( void*, int* ) { return 1; }
EXPORTED int bfcAttach( void*, int ) { return 1; }
EXPORTED int bfcDetach( void* ) { return 1; }
EXPORTED int bfcQueryCardType( void*, int*, int ) { return 1; }
EXPORTED int bfcQueryCardProperty32( void*, int, uint32_t* ) { return 1; }
EXPORTED int bfcSetCardProperty32( void*, int, uint32_t ) { return 1; }
EXPORTED int bfcVideoCaptureStop( void* ) { return 1; }
EXPORTED int bfcWaitVideoInputSync( void*, unsigned long, unsigned long* ) { return 1; }
EXPORTED int bfcRenderBufferCapture( void*, unsigned long ) { return 1; }
EXPORTED int bfcSystemBufferRead( void*, unsigned char*, unsigned long, unsigned long, unsigned long ) { return 1; }
EXPORTED int bfcDecodeHancFrameEx( void*, uint32_t, uint32_t*, void* ) { return 1; }

EXPORTED uint32_t bfcGetPixelsPerLine( uint32_t i_Mode ) { return i_Mode; }
EXPORTED uint32_t bfcGetLinesPerFrame( uint32_t i_Mode, uint32_t i_UpdateMethod ) { return i_Mode * 100 + i_UpdateMethod; }
EXPORTED uint32_t bfcGetBytesPerLine( uint32_t i_Mode, uint32_t i_MemoryFormat ) { return i_Mode * 100 + i_MemoryFormat; }
EXPORTED uint32_t bfcGetGoldenValue( uint32_t i_Mode, uint32_t i_MemoryFormat, uint32_t i_UpdateMethod )
{
  return i_Mode * 10000 + i_MemoryFormat * 100 + i_UpdateMethod;
}
