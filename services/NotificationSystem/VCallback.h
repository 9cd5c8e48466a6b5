#pragma once

#include <functional>
#include <mutex>
#include <utility>

namespace NotificationSystem
{
  template < typename Signature > class VCallback;

  // Holds at most one function of the given signature. Setting, clearing and calling are safe from
  // any thread; a call with nothing set does nothing. The function runs outside the lock, on a copy
  // taken at the call, so it may set or clear this very callback, and a clear that races a call
  // lets that call finish with the function it took.
  template < typename... Args > class VCallback< void( Args... ) >
  {
  public:
    using Function = std::function< void( Args... ) >;

    VCallback() = default;
    VCallback( const VCallback& ) = delete;
    VCallback& operator=( const VCallback& ) = delete;

    void Set( Function i_Function )
    {
      std::lock_guard< std::mutex > Lock( m_Mutex );
      m_Function = std::move( i_Function );
    }

    void Clear() { Set( Function() ); }

    bool IsSet() const
    {
      std::lock_guard< std::mutex > Lock( m_Mutex );
      return static_cast< bool >( m_Function );
    }

    void operator()( Args... i_Args ) const
    {
      Function Copy;
      {
        std::lock_guard< std::mutex > Lock( m_Mutex );
        Copy = m_Function;
      }
      if( Copy )
        Copy( std::forward< Args >( i_Args )... );
    }

  private:
    mutable std::mutex m_Mutex;
    Function m_Function;
  };
} // namespace NotificationSystem
