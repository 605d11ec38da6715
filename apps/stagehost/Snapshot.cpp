#include "apps/stagehost/Snapshot.h"

#include "CoreVideoUtils/FrameSize.h"
#include "CoreVideoUtils/PixelFormatConverter.h"
#include "FileIO/PNGIO/PNGIO.h"

#include <algorithm>
#include <cstdio>
#include <memory>
#include <vector>

namespace
{

// Top line first, as PNG has it.
void TurnUpright( std::vector<uint8_t>& io_rPixels, size_t i_RowBytes )
{
  for( size_t Top = 0, Bottom = io_rPixels.size() - i_RowBytes; Top < Bottom; Top += i_RowBytes, Bottom -= i_RowBytes )
  {
    std::swap_ranges( io_rPixels.begin() + static_cast<ptrdiff_t>( Top ), io_rPixels.begin() + static_cast<ptrdiff_t>( Top + i_RowBytes ),
      io_rPixels.begin() + static_cast<ptrdiff_t>( Bottom ) );
  }
}

bool WriteFile( const std::string& i_rPath, const void* i_pBytes, size_t i_Size )
{
  const std::unique_ptr<FILE, int ( * )( FILE* )> pFile( std::fopen( i_rPath.c_str(), "wb" ), &std::fclose );
  return pFile && std::fwrite( i_pBytes, 1, i_Size, pFile.get() ) == i_Size && std::fflush( pFile.get() ) == 0;
}

}

bool WriteSnapshot( const KVZ::VFlowVideoFrame& i_rFrame, const std::string& i_rPath, std::string& o_rError )
{
  KVZ::VideoFrameInfo Info = i_rFrame.m_Info;
  Info.m_PixelFormat = KVZ::IPixelFormat::ER8G8B8;
  std::vector<uint8_t> Pixels( CoreVideoUtils::GetFrameSize( Info ) );
  CoreVideoUtils::VPixelFormatConverter Converter;
  if( Pixels.empty() ||
    !Converter.Convert( i_rFrame.m_Info, i_rFrame.m_pBuffer->Data(), i_rFrame.m_pBuffer->Size(), Info.m_PixelFormat, Pixels.data(), Pixels.size() ) )
  {
    o_rError = "Images in " + KVZ::ToName( i_rFrame.m_Info.m_PixelFormat ) + " cannot be converted.";
    return false;
  }
  if( Info.m_bInverted )
  {
    TurnUpright( Pixels, Info.m_ImageWidth * size_t( 3 ) );
    Info.m_bInverted = false;
  }
  UtilsMemory::VByteVector Png;
  if( !PNGIO::PNGWriter( Pixels.data(), Pixels.size(), Info, Png ) )
  {
    o_rError = "The image cannot be written as PNG.";
    return false;
  }
  if( !WriteFile( i_rPath, Png.data(), Png.size() ) )
  {
    o_rError = "The file \"" + i_rPath + "\" cannot be written.";
    return false;
  }
  return true;
}
