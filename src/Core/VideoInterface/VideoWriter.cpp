#include "Core/VideoInterface/VideoWriter.h"

namespace KVZ
{

void VVideoWriterFactory::Register( IVideoContainer::Enum i_Container, VMaker i_Maker ) { m_Makers[i_Container] = std::move( i_Maker ); }

bool VVideoWriterFactory::IsRegistered( IVideoContainer::Enum i_Container ) const { return m_Makers.count( i_Container ) != 0; }

std::shared_ptr<IVideoWriter> VVideoWriterFactory::Make( IVideoContainer::Enum i_Container,
  std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder ) const
{
  const auto Found = m_Makers.find( i_Container );
  return Found == m_Makers.end() ? nullptr : Found->second( i_Container, std::move( i_pEncoder ) );
}

}
