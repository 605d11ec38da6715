#include "CoreGraphics/Mesh.h"

#include <QtGui/QOpenGLContext>

namespace CoreGraphics
{

namespace
{

// One strip of triangles, row by row. Between rows a vertex stands twice on either side, which makes triangles without area.
std::vector<float> MakeStrip( uint32_t i_Columns, uint32_t i_Rows )
{
  std::vector<float> Coordinates;
  Coordinates.reserve( size_t{ 4 } * i_Rows * ( i_Columns + 2 ) );
  const auto Add = [&]( uint32_t i_Column, uint32_t i_Row )
  {
    Coordinates.push_back( static_cast<float>( i_Column ) / static_cast<float>( i_Columns ) );
    Coordinates.push_back( static_cast<float>( i_Row ) / static_cast<float>( i_Rows ) );
  };
  for( uint32_t Row = 0; Row < i_Rows; ++Row )
  {
    Add( 0, Row );
    for( uint32_t Column = 0; Column <= i_Columns; ++Column )
    {
      Add( Column, Row );
      Add( Column, Row + 1 );
    }
    Add( i_Columns, Row + 1 );
  }
  return Coordinates;
}

}

VVertexBuffer::VVertexBuffer( const std::vector<float>& i_rCoordinates ) : m_Count( static_cast<GLsizei>( i_rCoordinates.size() / 2 ) )
{
  if( m_Buffer.create() && m_Buffer.bind() )
  {
    m_Buffer.allocate( i_rCoordinates.data(), static_cast<int>( i_rCoordinates.size() * sizeof( float ) ) );
  }
}

void VVertexBuffer::Bind( GLuint i_Attribute )
{
  QOpenGLFunctions& rFunctions = *QOpenGLContext::currentContext()->functions();
  m_Buffer.bind();
  rFunctions.glEnableVertexAttribArray( i_Attribute );
  rFunctions.glVertexAttribPointer( i_Attribute, 2, GL_FLOAT, GL_FALSE, 0, nullptr );
}

VMesh::VMesh( uint32_t i_Columns, uint32_t i_Rows ) : m_Columns( i_Columns ), m_Rows( i_Rows ), m_Vertices( MakeStrip( i_Columns, i_Rows ) ) {}

void VMesh::Draw( GLuint i_Attribute )
{
  m_Vertices.Bind( i_Attribute );
  QOpenGLContext::currentContext()->functions()->glDrawArrays( GL_TRIANGLE_STRIP, 0, m_Vertices.Count() );
}

}
