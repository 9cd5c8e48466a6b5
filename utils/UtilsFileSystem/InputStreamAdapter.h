#pragma once

// Makes a concrete stream class into a ZOL::IInputStreamSeekable by owning it by value: the
// concrete classes stay free of virtual calls for the code that knows them, and a reader that
// takes any stream gets one through this.

#include "utils/Streams.h"

#include <utility>

namespace ZOL
{
  template < typename T > class IInputStreamSeekableOwningAdapter : public IInputStreamSeekable
  {
  public:
    template < typename... Args >
    explicit IInputStreamSeekableOwningAdapter( Args&&... i_rArguments )
        : m_Stream( std::forward< Args >( i_rArguments )... )
    {
    }

    T& Get() { return m_Stream; }
    const T& Get() const { return m_Stream; }

    bool Read( void* o_pBuffer, std::uint64_t i_Size ) override
    {
      return m_Stream.IsOpen() && m_Stream.Read( o_pBuffer, i_Size );
    }
    bool IsAtEnd() override { return m_Stream.IsOpen() && m_Stream.IsAtEnd(); }
    bool GetSize( std::uint64_t& o_rSize ) override { return m_Stream.GetSize( o_rSize ); }
    bool GetPosition( std::uint64_t& o_rPosition ) override { return m_Stream.GetPosition( o_rPosition ); }
    bool Seek( std::int64_t i_Position ) override { return m_Stream.Seek( i_Position ); }

  private:
    T m_Stream;
  };
} // namespace ZOL
