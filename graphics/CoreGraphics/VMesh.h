#pragma once

// Vertex layouts and the GPU buffers of a mesh. All calls that touch a buffer need a current
// OpenGL context.

#include <QOpenGLBuffer>
#include <qopengl.h>

#include <cstddef>
#include <cstdint>
#include <vector>

namespace CoreGraphics
{
  // Attribute numbers of the standard attributes; a layout entry names one of these.
  enum EStandardAttribute : std::uint8_t
  {
    Attribute_Position = 0,
    Attribute_Normal = 1,
    Attribute_Colour = 2,
    Attribute_UV = 3,
    Attribute_BoneIndices = 4,
    Attribute_BoneWeights = 5,
  };
  constexpr int StandardAttributeCount = 6;

  // The shader name of a standard attribute ("a_position", ...), or nullptr.
  const char* StandardAttributeName( int i_Attribute );

  struct VVertexLayoutEntry
  {
    enum EType : std::uint8_t
    {
      Type_Byte = 0,
      Type_UnsignedByte = 1,
      Type_Short = 2,
      Type_UnsignedShort = 3,
      Type_Float = 4,
    };

    std::uint8_t Attribute = Attribute_Position;
    std::uint8_t Components = 0;
    std::uint8_t Normalised = 0;
    std::uint8_t Type = Type_Float;
    std::uint32_t Offset = 0;

    GLenum GetGLType() const;
  };

  struct VVertexLayout
  {
    std::vector< VVertexLayoutEntry > Entries;
    std::uint32_t Stride = 0;

    // The four layouts every program of this system is written against, built on first use.
    static const VVertexLayout& Position2D();
    static const VVertexLayout& Position3D();
    static const VVertexLayout& PositionColour();
    static const VVertexLayout& PositionNormal();
  };

  class VVertexBuffer
  {
  public:
    VVertexBuffer();

    // Fills the buffer once for good (static draw). False without a context or on failure.
    bool Create( const VVertexLayout& i_rLayout, const void* i_pData, std::size_t i_ByteCount );
    // Sizes the buffer for later partial writes (dynamic draw).
    bool Reserve( const VVertexLayout& i_rLayout, std::size_t i_ByteCount );
    // Writes into a reserved buffer; a write that would pass its end is ignored and gives false.
    bool Write( std::size_t i_Offset, const void* i_pData, std::size_t i_ByteCount );

    QOpenGLBuffer& GetBuffer() { return m_Buffer; }
    const VVertexLayout* GetLayout() const { return m_pLayout; }
    std::uint32_t GetVertexCount() const { return m_VertexCount; }
    std::size_t GetByteCount() const { return m_ByteCount; }

  private:
    bool Allocate( const VVertexLayout& i_rLayout, const void* i_pData, std::size_t i_ByteCount,
                   QOpenGLBuffer::UsagePattern i_Usage );

    QOpenGLBuffer m_Buffer;
    const VVertexLayout* m_pLayout = nullptr;
    std::uint32_t m_VertexCount = 0;
    std::size_t m_ByteCount = 0;
  };

  class VIndexBuffer
  {
  public:
    VIndexBuffer();

    bool Create( const std::vector< std::uint16_t >& i_rIndices );
    bool Create( const std::vector< std::uint32_t >& i_rIndices );

    QOpenGLBuffer& GetBuffer() { return m_Buffer; }
    // GL_UNSIGNED_SHORT or GL_UNSIGNED_INT.
    GLenum GetIndexType() const { return m_IndexType; }
    std::uint32_t GetIndexCount() const { return m_IndexCount; }

  private:
    bool Allocate( const void* i_pData, std::size_t i_ByteCount );

    QOpenGLBuffer m_Buffer;
    GLenum m_IndexType = GL_UNSIGNED_SHORT;
    std::uint32_t m_IndexCount = 0;
  };

  struct VMesh
  {
    VVertexBuffer Vertices;
    VIndexBuffer Indices;
  };
} // namespace CoreGraphics
