#pragma once
// Makes calls on files fail when the component makes them. The test program is linked so that the calls in its own
// objects come here first; the host library and the C library are not affected.

enum class FileCall { kChmod, kUnlink, kLink, kFclose, kWritev, kCount };

/// While it lives, the n-th call of the function from now on fails with `error`, once. A stream is closed all the same,
/// and a gathered write is no failure, but writes only half of its first piece, as the system may. One for each
/// function at a time.
class FailingFile {
 public:
  FailingFile(FileCall call, int error, int nth = 1);
  ~FailingFile();
  FailingFile(const FailingFile&) = delete;
  FailingFile& operator=(const FailingFile&) = delete;
  [[nodiscard]] bool happened() const;

 private:
  const FileCall call_;
};
