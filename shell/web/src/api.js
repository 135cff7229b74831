// The server's JSON interface and the session's event stream.

export class ApiError extends Error {
  constructor(status, message, details = {}) {
    super(message);
    this.status = status;
    this.details = details;
  }
}

export class Connection {
  constructor() {
    this.session = null;
    this.events = null;
  }

  // Starts this tab's own session; `user` and `password` only when the server asks for a login.
  async start(user, password) {
    const body = password === undefined ? {} : { user, password };
    const reply = await this.request('POST', '/api/session', body, false);
    this.session = reply.session;
    return reply;
  }

  async request(method, path, body, withSession = true) {
    const headers = { 'Content-Type': 'application/json' };
    if (withSession && this.session) headers['X-Pelta-Session'] = this.session;
    const response = await fetch(path, {
      method,
      headers,
      body: body === undefined ? undefined : JSON.stringify(body),
      credentials: 'same-origin',
    });
    let data = null;
    try {
      data = await response.json();
    } catch {
      data = null;
    }
    if (!response.ok) {
      const error = data && data.error ? data.error : {};
      throw new ApiError(response.status, error.message || response.statusText, error);
    }
    return data;
  }

  get(path) {
    return this.request('GET', path);
  }
  post(path, body = {}) {
    return this.request('POST', path, body);
  }
  del(path) {
    return this.request('DELETE', path);
  }

  // Server-sent events of the session: handlers by event type.
  listen(handlers) {
    this.events = new EventSource(`/api/events?session=${encodeURIComponent(this.session)}`);
    for (const [type, handler] of Object.entries(handlers)) {
      if (type === 'error') this.events.onerror = handler;
      else this.events.addEventListener(type, (e) => handler(JSON.parse(e.data)));
    }
  }

  // A closing tab ends its session at once instead of waiting for the idle time.
  closeOnExit() {
    window.addEventListener('pagehide', () => {
      if (!this.session) return;
      navigator.sendBeacon(`/api/session/close?session=${encodeURIComponent(this.session)}`, '');
    });
  }
}
