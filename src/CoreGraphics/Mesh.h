// The unit square as a mesh that shaders can bend. Belongs to the OpenGL context that is current when it is made, like all it needs.
#pragma once

#include <QtGui/QOpenGLBuffer>
#include <QtGui/QOpenGLFunctions>

#include <cstdint>
#include <vector>

namespace CoreGraphics
{

// Vertices of two components in the graphics card's memory.
class VVertexBuffer
{
public:
  // x and y of one vertex after the other.
  explicit VVertexBuffer( const std::vector<float>& i_rCoordinates );

  bool IsValid() const { return m_Buffer.isCreated(); }
  GLsizei Count() const { return m_Count; }
  // As the attribute at this place, until another buffer is bound.
  void Bind( GLuint i_Attribute );

private:
  QOpenGLBuffer m_Buffer{ QOpenGLBuffer::VertexBuffer };
  const GLsizei m_Count;
};

// 0 to 1 in both directions, in cells of equal size of two triangles each. One cell is a plain quad.
class VMesh
{
public:
  VMesh( uint32_t i_Columns, uint32_t i_Rows );

  bool IsValid() const { return m_Vertices.IsValid(); }
  bool Has( uint32_t i_Columns, uint32_t i_Rows ) const { return i_Columns == m_Columns && i_Rows == m_Rows; }
  // With the program in use.
  void Draw( GLuint i_Attribute );

private:
  const uint32_t m_Columns;
  const uint32_t m_Rows;
  VVertexBuffer m_Vertices;
};

}
