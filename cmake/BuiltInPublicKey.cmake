# st_built_in_public_key(SOURCE): writes the C++ file SOURCE, which holds the text of ST_PUBLIC_KEY_FILE. Configuring
# stops when the file is not of the one form that the program hands to Windows; a change of the file configures anew.
function(st_built_in_public_key source)
  set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS "${ST_PUBLIC_KEY_FILE}")
  if(NOT EXISTS "${ST_PUBLIC_KEY_FILE}")
    message(FATAL_ERROR "ST_PUBLIC_KEY_FILE: there is no file ${ST_PUBLIC_KEY_FILE}. tools/make_keys.sh makes a key pair.")
  endif()
  file(READ "${ST_PUBLIC_KEY_FILE}" key)
  string(REGEX REPLACE "\r?\n$" "" key "${key}") # an editor may have ended the line
  string(LENGTH "${key}" length)

  # An RSA SubjectPublicKeyInfo of 1024 bits with the exponent 65537 always begins and ends with the same Base64.
  if(NOT length EQUAL 266 OR NOT key MATCHES
     "^-----BEGIN PUBLIC KEY-----MIGfMA0GCSqGSIb3DQEBAQUAA4GNADCBiQKBgQ[A-Za-z0-9+/]+IDAQAB-----END PUBLIC KEY-----$")
    message(FATAL_ERROR
      "ST_PUBLIC_KEY_FILE: ${ST_PUBLIC_KEY_FILE} is not a public key of the form that packages need: a PEM \"PUBLIC KEY\" "
      "in one line of 266 characters without line breaks, RSA with 1024 bits and the public exponent 65537 "
      "(this file: ${length} characters). tools/make_keys.sh makes such a key pair.")
  endif()

  set(development_key ${PROJECT_SOURCE_DIR}/stutil/keys/development_public_key.pem)
  if(EXISTS ${development_key})
    file(READ ${development_key} development)
    string(STRIP "${development}" development)
  endif()
  if(key STREQUAL development)
    message(STATUS "Public key: the DEVELOPMENT key, whose private half is in the source tree. Not for shipping.")
  else()
    message(STATUS "Public key: ${ST_PUBLIC_KEY_FILE}")
  endif()

  set(ST_PUBLIC_KEY "${key}")
  configure_file(${PROJECT_SOURCE_DIR}/stutil/built_in_public_key.cpp.in ${source} @ONLY)
endfunction()
