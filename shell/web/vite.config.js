import { defineConfig } from 'vite';

// `npm run dev` proxies the JSON interface and the event stream to a running
// `pelta serve`; `npm run build` writes dist/, which pelta serves itself.
export default defineConfig({
  base: './',
  build: { outDir: 'dist', emptyOutDir: true, chunkSizeWarningLimit: 2000 },
  server: { proxy: { '/api': 'http://127.0.0.1:8080' } },
});
