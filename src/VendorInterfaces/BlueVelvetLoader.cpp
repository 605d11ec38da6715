#include "VendorInterfaces/BlueVelvetLoader.h"

#include <dlfcn.h>

namespace BlueVelvet
{

namespace
{

template<class TFunction>
void Find( void* i_pLibrary, const char* i_pName, TFunction*& o_rpFunction )
{
  o_rpFunction = reinterpret_cast<TFunction*>( dlsym( i_pLibrary, i_pName ) );
}

}

VRuntimeLibrary::VRuntimeLibrary( const char* i_pName )
{
  void* const pLibrary = dlopen( i_pName, RTLD_LAZY | RTLD_GLOBAL );
  if( !pLibrary )
  {
    return;
  }
  Find( pLibrary, "bfcFactory", m_Functions.bfcFactory );
  Find( pLibrary, "bfcDestroy", m_Functions.bfcDestroy );
  Find( pLibrary, "bfcEnumerate", m_Functions.bfcEnumerate );
  Find( pLibrary, "bfcAttach", m_Functions.bfcAttach );
  Find( pLibrary, "bfcDetach", m_Functions.bfcDetach );
  Find( pLibrary, "bfcQueryCardType", m_Functions.bfcQueryCardType );
  Find( pLibrary, "bfcQueryCardProperty32", m_Functions.bfcQueryCardProperty32 );
  Find( pLibrary, "bfcSetCardProperty32", m_Functions.bfcSetCardProperty32 );
  Find( pLibrary, "bfcVideoCaptureStop", m_Functions.bfcVideoCaptureStop );
  Find( pLibrary, "bfcWaitVideoInputSync", m_Functions.bfcWaitVideoInputSync );
  Find( pLibrary, "bfcRenderBufferCapture", m_Functions.bfcRenderBufferCapture );
  Find( pLibrary, "bfcSystemBufferRead", m_Functions.bfcSystemBufferRead );
  Find( pLibrary, "bfcDecodeHancFrameEx", m_Functions.bfcDecodeHancFrameEx );
  Find( pLibrary, "bfcGetVideoInfo", m_Functions.bfcGetVideoInfo );
  Find( pLibrary, "bfcGetPixelsPerLine", m_Functions.bfcGetPixelsPerLine );
  Find( pLibrary, "bfcGetLinesPerFrame", m_Functions.bfcGetLinesPerFrame );
  Find( pLibrary, "bfcGetBytesPerLine", m_Functions.bfcGetBytesPerLine );
  Find( pLibrary, "bfcGetGoldenValue", m_Functions.bfcGetGoldenValue );
}

const VFlatFunctions* RuntimeFunctions()
{
  static const VRuntimeLibrary s_Library( "libBlueVelvetC64.so" );
  return s_Library.Functions();
}

}
