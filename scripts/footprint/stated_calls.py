"""What the machine code cannot tell about the module's calls: where its indirect calls go, and how
deep its recursions are."""

ENTRY_POINTS = ["nanoappStart", "nanoappHandleEvent", "nanoappEnd",
                # Handed to the runtime with what is sent.
                "FreeQueryResponse", "FreeDetection", "FreeRawAudio", "ChreEventFree"]

# Imported functions run on the runtime's account: their stack counts 0 here.
RUNTIME = []

# In our own sources: end of the file's path, text in the line of the call, in how many places it
# stands, functions that it may reach. "table NAME" stands for every function in that constant table.
INDIRECT_IN_SOURCES = [
    ("app/audio_binding.cc", "funcPtr(", 2, RUNTIME),
    ("classifier/detection.cc", "listener_->OnSoundDetectionEvent(", 1,
     ["AppManager::OnSoundDetectionEvent"]),
    ("chre/singleton.h", "->~T()", 1, ["AppManager::~AppManager"]),
]

# The three functions that our messages give to nanopb. They only encode: no message that is decoded
# has one.
ENCODE_CALLBACKS = ["EncodeDetectionSoundResult", "EncodeQueryResponseSupportedCategories",
                    "EncodeRawAudioValues"]
# Both kinds of stream are of memory. A field that its message handles itself goes through the
# default callback, which calls nothing further in decoding. "alone NAME" stands for that.
DECODING = ["buf_read", "alone pb_default_field_callback"]

# In nanopb's library, which comes without sources: function, number of indirect calls in it, what
# they may reach.
INDIRECT_IN_LIBRARIES = [
    ("pb_default_field_callback", 2, ENCODE_CALLBACKS),
    ("pb_write", 1, ["buf_write"]),
    ("pb_encode_fixed32", 1, ["buf_write"]),
    ("pb_encode_fixed64", 1, ["buf_write"]),
    ("encode_basic_field.part.0", 1, ENCODE_CALLBACKS),
    ("encode_field", 1, ["pb_default_field_callback"]),
    ("pb_encode", 1, []),  # encoders of extensions, of which our messages have none
    ("pb_read", 2, ["buf_read"]),
    ("pb_skip_field", 1, ["buf_read"]),
    ("pb_decode_varint", 1, ["buf_read"]),
    ("pb_decode_varint32_eof", 2, ["buf_read"]),
    ("pb_decode_fixed32", 1, ["buf_read"]),
    ("pb_decode_fixed64", 1, ["buf_read"]),
    ("decode_basic_field", 4, DECODING),
    ("decode_field", 2, DECODING),
    ("pb_decode_inner", 1, []),  # decoders of extensions
    # Not a call: division jumps into its own unrolled steps.
    ("__udivsi3", 1, []),
]

# Which messages the module encodes and which it decodes, of proto/sound_detection.proto.
ENCODED = ["SoundDetectionQueryResponse", "SoundDetectionEventResponse", "RawAudioSegment"]
DECODED = ["SoundDetectionEnableRequest", "SoundDetectionDisableRequest"]

# The only recursions: nanopb descends into messages within messages. Function, and the messages in
# which it descends: it is entered once for each level of the deepest of them.
DESCENTS = [
    ("pb_encode", ENCODED),
    ("pb_check_proto3_default_value", ENCODED),
    ("pb_decode_inner", DECODED),
    ("pb_message_set_to_defaults", DECODED),
    ("pb_release_single_field", DECODED),
]
# A read that skips calls itself once, to read into a buffer of its own.
SELF_CALLS = [("pb_read", 2)]
