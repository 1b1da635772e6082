"""What FailingCalls can be asked for."""
import errno

# What a kind of call can fail with; 0: it does a half of what it should.
ERRORS = {
    "open": [errno.EIO, errno.ENOSPC],
    "pwrite": [errno.EIO, errno.ENOSPC, errno.EDQUOT, errno.EINTR, 0],
    "write": [errno.EIO, errno.EINTR, 0],
    "read": [errno.EIO, errno.EINTR, 0],
    "fsync": [errno.EIO, errno.EDQUOT],
    "rename": [errno.EIO],
    "close": [errno.EIO],
    "mmap": [errno.ENOMEM],
    "fstat": [errno.EIO],
    "stat": [errno.EIO],
    "lstat": [errno.EIO],
    "flock": [errno.ENOLCK, errno.EINTR],
    "fchmod": [errno.EIO, errno.EPERM],
    "readdir": [errno.EIO],
}
