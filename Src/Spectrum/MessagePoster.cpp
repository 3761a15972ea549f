#include "Spectrum/MessagePoster.h"

MessagePoster::~MessagePoster() = default;

void SpectrumStaticInfo::SetMessagePoster(MessagePoster* poster) { m_poster = poster; }
MessagePoster* SpectrumStaticInfo::GetMessagePoster() const { return m_poster; }
