#include "cards/common/CapturedFrame.h"

#include <boost/thread/lock_guard.hpp>

namespace VirtualCards
{

void VCapturedFrame::Begin( const VSignalFrame& i_rSignal, const VPictureFormat& i_rFormat, std::shared_ptr<const IPainter> i_pPainter )
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Signal = i_rSignal;
  m_Format = i_rFormat;
  m_pPainter = std::move( i_pPainter );
  m_bPainted = false;
  m_bWritten = false;
}

uint8_t* VCapturedFrame::PictureBytes()
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( !m_bPainted && m_pPainter )
  {
    m_pPainter->Paint( m_Picture, m_Signal );
  }
  m_bPainted = true;
  return m_Picture.Bytes( m_Format.Size() );
}

uint8_t* VCapturedFrame::SoundBytes( const VSoundLayout& i_rLayout )
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( !m_bWritten )
  {
    m_SoundBytes.resize( i_rLayout.BytesPerFrame() * m_Sound.m_Samples );
    m_Sound.Write( i_rLayout, m_SoundBytes.data() );
    m_bWritten = true;
  }
  return m_SoundBytes.data();
}

}
