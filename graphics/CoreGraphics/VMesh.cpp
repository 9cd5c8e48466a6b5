#include "graphics/CoreGraphics/VMesh.h"

#include <QOpenGLContext>

namespace CoreGraphics
{
  const char* StandardAttributeName( int i_Attribute )
  {
    static const char* const Names[StandardAttributeCount] = { "a_position", "a_normal",      "a_colour",
                                                               "a_uv",       "a_BoneIndices", "a_BoneWeights" };
    return ( i_Attribute >= 0 && i_Attribute < StandardAttributeCount ) ? Names[i_Attribute] : nullptr;
  }

  GLenum VVertexLayoutEntry::GetGLType() const
  {
    static const GLenum Types[] = { GL_BYTE, GL_UNSIGNED_BYTE, GL_SHORT, GL_UNSIGNED_SHORT, GL_FLOAT };
    return Type < sizeof( Types ) / sizeof( Types[0] ) ? Types[Type] : GL_FLOAT;
  }

  const VVertexLayout& VVertexLayout::Position2D()
  {
    static const VVertexLayout Layout{ { { Attribute_Position, 2, 0, VVertexLayoutEntry::Type_Float, 0 } }, 8 };
    return Layout;
  }

  const VVertexLayout& VVertexLayout::Position3D()
  {
    static const VVertexLayout Layout{ { { Attribute_Position, 3, 0, VVertexLayoutEntry::Type_Float, 0 } }, 12 };
    return Layout;
  }

  const VVertexLayout& VVertexLayout::PositionColour()
  {
    static const VVertexLayout Layout{ { { Attribute_Position, 3, 0, VVertexLayoutEntry::Type_Float, 0 },
                                         { Attribute_Colour, 4, 1, VVertexLayoutEntry::Type_UnsignedByte, 12 } },
                                       16 };
    return Layout;
  }

  const VVertexLayout& VVertexLayout::PositionNormal()
  {
    static const VVertexLayout Layout{ { { Attribute_Position, 3, 0, VVertexLayoutEntry::Type_Float, 0 },
                                         { Attribute_Normal, 3, 0, VVertexLayoutEntry::Type_Float, 12 } },
                                       24 };
    return Layout;
  }

  VVertexBuffer::VVertexBuffer() : m_Buffer( QOpenGLBuffer::VertexBuffer ) {}

  bool VVertexBuffer::Create( const VVertexLayout& i_rLayout, const void* i_pData, std::size_t i_ByteCount )
  {
    return Allocate( i_rLayout, i_pData, i_ByteCount, QOpenGLBuffer::StaticDraw );
  }

  bool VVertexBuffer::Reserve( const VVertexLayout& i_rLayout, std::size_t i_ByteCount )
  {
    return Allocate( i_rLayout, nullptr, i_ByteCount, QOpenGLBuffer::DynamicDraw );
  }

  bool VVertexBuffer::Write( std::size_t i_Offset, const void* i_pData, std::size_t i_ByteCount )
  {
    if( !m_Buffer.isCreated() || i_Offset > m_ByteCount || i_ByteCount > m_ByteCount - i_Offset )
      return false;
    if( !m_Buffer.bind() )
      return false;
    m_Buffer.write( static_cast< int >( i_Offset ), i_pData, static_cast< int >( i_ByteCount ) );
    m_Buffer.release();
    return true;
  }

  bool VVertexBuffer::Allocate( const VVertexLayout& i_rLayout, const void* i_pData, std::size_t i_ByteCount,
                                QOpenGLBuffer::UsagePattern i_Usage )
  {
    if( QOpenGLContext::currentContext() == nullptr || i_ByteCount > std::size_t( INT32_MAX ) || i_rLayout.Stride == 0 )
      return false;
    if( !m_Buffer.isCreated() && !m_Buffer.create() )
      return false;
    m_Buffer.setUsagePattern( i_Usage );
    m_Buffer.bind();
    m_Buffer.allocate( i_pData, static_cast< int >( i_ByteCount ) );
    m_Buffer.release();
    m_pLayout = &i_rLayout;
    m_ByteCount = i_ByteCount;
    m_VertexCount = static_cast< std::uint32_t >( i_ByteCount / i_rLayout.Stride );
    return true;
  }

  VIndexBuffer::VIndexBuffer() : m_Buffer( QOpenGLBuffer::IndexBuffer ) {}

  bool VIndexBuffer::Create( const std::vector< std::uint16_t >& i_rIndices )
  {
    if( !Allocate( i_rIndices.data(), i_rIndices.size() * sizeof( std::uint16_t ) ) )
      return false;
    m_IndexType = GL_UNSIGNED_SHORT;
    m_IndexCount = static_cast< std::uint32_t >( i_rIndices.size() );
    return true;
  }

  bool VIndexBuffer::Create( const std::vector< std::uint32_t >& i_rIndices )
  {
    if( !Allocate( i_rIndices.data(), i_rIndices.size() * sizeof( std::uint32_t ) ) )
      return false;
    m_IndexType = GL_UNSIGNED_INT;
    m_IndexCount = static_cast< std::uint32_t >( i_rIndices.size() );
    return true;
  }

  bool VIndexBuffer::Allocate( const void* i_pData, std::size_t i_ByteCount )
  {
    if( QOpenGLContext::currentContext() == nullptr || i_ByteCount > std::size_t( INT32_MAX ) )
      return false;
    if( !m_Buffer.isCreated() && !m_Buffer.create() )
      return false;
    m_Buffer.setUsagePattern( QOpenGLBuffer::StaticDraw );
    m_Buffer.bind();
    m_Buffer.allocate( i_pData, static_cast< int >( i_ByteCount ) );
    m_Buffer.release();
    return true;
  }
} // namespace CoreGraphics
