# Bash completion for apktoolkit-sim: its options, their values, and the names of files.

_apktoolkit_sim() {
  local word=${COMP_WORDS[COMP_CWORD]} before=${COMP_WORDS[COMP_CWORD - 1]}
  # Bash splits "--option=value" into three words.
  if [[ $word == = ]]; then
    word=
  elif [[ $before == = && $COMP_CWORD -gt 1 ]]; then
    before=${COMP_WORDS[COMP_CWORD - 2]}
  fi

  COMPREPLY=()
  case $before in
    --integrity)
      mapfile -t COMPREPLY < <(compgen -W "1f 0 missing ffffffff,ffffffff,1f" -- "$word")
      ;;
    --sign-errno | --verify-errno)
      mapfile -t COMPREPLY < <(
        compgen -W "EACCES EBADMSG EINVAL EIO EKEYREJECTED ENOKEY ENOSYS EOPNOTSUPP EPERM" \
          -- "$word"
      )
      ;;
    --zu-result)
      mapfile -t COMPREPLY < <(compgen -W "0 65540 -1" -- "$word")
      ;;
    --install)
      mapfile -t COMPREPLY < <(compgen -W "phone all arm64 arm no" -- "$word")
      ;;
    --installer)
      mapfile -t COMPREPLY < <(compgen -W "auto required off" -- "$word")
      ;;
    --api)
      mapfile -t COMPREPLY < <(compgen -W "27- 27-29 30-" -- "$word")
      ;;
    --state)
      compopt -o filenames
      mapfile -t COMPREPLY < <(compgen -d -- "$word")
      ;;
    --files-from)
      compopt -o filenames
      mapfile -t COMPREPLY < <(compgen -f -- "$word")
      ;;
    --runner | --tool)
      compopt -o filenames
      mapfile -t COMPREPLY < <(compgen -c -- "$word" && compgen -f -- "$word")
      ;;
    --timeout | --jobs | --signer | -h | --help | --version) ;;
    *)
      if [[ $word == -* ]]; then
        mapfile -t COMPREPLY < <(
          compgen -W "--api --files-from --help --html --install --installer --integrity --jobs --journal
            --json --junit --null --quiet --recursive --runner --sarif --sign-errno --signer --state
            --strict --timeout --tool --trust --verbose --verify --verify-errno --version --werror
            --zu-result" -- "$word"
        )
      else
        compopt -o filenames
        mapfile -t COMPREPLY < <(compgen -f -- "$word")
      fi
      ;;
  esac
}

complete -F _apktoolkit_sim apktoolkit-sim
