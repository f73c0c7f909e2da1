#pragma once

#include <ZEK/Result.h>

#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <span>
#include <string>
#include <vector>

namespace HostSources
{

/// Bytes of known number, read in pieces.
class IByteSource
{
public:
  virtual ~IByteSource() = default;
  virtual std::uint64_t Size() const = 0;
  /// The bytes from `i_Offset` on, fewer than asked for at the end or after a failed read; good until the next call.
  virtual std::span< const std::byte > Read( std::uint64_t i_Offset, std::size_t i_Count ) = 0;
};

/// Bytes that lie in memory, which it does not own.
class VMemorySource final : public IByteSource
{
public:
  explicit VMemorySource( std::span< const std::byte > i_Bytes )
    : m_Bytes( i_Bytes )
  {
  }
  std::uint64_t Size() const override { return m_Bytes.size(); }
  std::span< const std::byte > Read( std::uint64_t i_Offset, std::size_t i_Count ) override;

private:
  std::span< const std::byte > m_Bytes;
};

/// An open file. It is read, not mapped: a mapped file that shrinks meanwhile would end the process.
class VFileSource final : public IByteSource
{
public:
  VFileSource() = default;
  ~VFileSource() override;
  VFileSource( const VFileSource& ) = delete;
  VFileSource& operator=( const VFileSource& ) = delete;

  /// `FileNotFound`, or `FileIOFailure` for what cannot be read, folders included; the message names the file and what
  /// was expected there.
  ZEK::IResult Open( const std::filesystem::path& i_rPath, std::string& o_rMessage,
                     const char* i_pExpected = "a recording" );
  std::uint64_t Size() const override { return m_Size; }
  std::span< const std::byte > Read( std::uint64_t i_Offset, std::size_t i_Count ) override;

private:
  void Close();

  int m_File = -1;
  std::uint64_t m_Size = 0;
  std::vector< std::byte > m_Buffer;
};

} // namespace HostSources
