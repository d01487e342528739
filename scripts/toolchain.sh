# Sourced by the scripts: the one place that names the LLVM release whose clang, sanitizer and
# fuzzer runtimes, llvm-cov and clang-format the checks use (Debian 12 ships 14 as its default).
# TARVEK_LLVM_VERSION overrides it.
llvm_version=${TARVEK_LLVM_VERSION:-14}
